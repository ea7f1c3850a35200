#include "host/checkout/present_contents.h"

#include "host/changes/digest.h"

#include <algorithm>
#include <filesystem>

namespace tav {

namespace {

namespace fs = std::filesystem;

/// `wanted` is a URL, empty where no file shall be.
bool isInTheWay(OdString const& path, OdString const& wanted, common::RootPath const& root, TreeUpdate const& update)
{
    auto const [begin, end] = update.expected.equal_range(path);
    std::error_code error;
    fs::file_type const type = fs::symlink_status(root.pathTo(path).ansi_str(), error).type();
    if (type == fs::file_type::not_found || type == fs::file_type::directory) {
        return begin != end && !wanted.isEmpty();
    }
    auto const digest = type == fs::file_type::regular ? fileDigest(root.pathTo(path)) : std::nullopt;
    auto const isIt = [&](auto const& file) { return digestOf(file.second) == digest; };
    bool const isWanted = !wanted.isEmpty() && digestOf(wanted) == digest;
    return !digest || (!isWanted && std::none_of(begin, end, isIt));
}

} // namespace

std::set<OdString> pathsInTheWay(common::RootPath const& root, TreeUpdate const& update)
{
    std::set<OdString> paths;
    for (auto const& [path, url] : update.writes) {
        if (isInTheWay(path, url, root, update)) {
            paths.insert(path);
        }
    }
    for (auto const& [path, url] : update.removals) {
        if (isInTheWay(path, OdString(), root, update)) {
            paths.insert(path);
        }
    }
    return paths;
}

} // namespace tav
