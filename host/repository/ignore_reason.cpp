#include "host/repository/ignore_reason.h"

#include "host/errors/failure.h"
#include "host/repository/ignore_file.h"
#include "host/text/utf8.h"

#include "common/mu_common_file_utils.h"

#include <algorithm>
#include <climits>
#include <filesystem>
#include <functional>
#include <regex>
#include <string>
#include <utility>
#include <vector>

namespace tav {

namespace {

/// The rules in effect, ready to be asked which one it is.
class RuleFinder {
public:
    explicit RuleFinder(std::vector<OdString> rules) : rules_(std::move(rules))
    {
        for (OdString const& rule : rules_) {
            expressions_.push_back(common::RepoIgnore::compile(rule));
        }
    }

    std::optional<IgnoreReason> whyIgnored(std::string const& name) const
    {
        if (name.size() > NAME_MAX) { // Rules take bounded time for names that a file can have.
            throw Failure("'" + name + "' is longer than a name can be.", "Type the path of a file.");
        }
        for (std::size_t i = 0; i < rules_.size(); ++i) {
            if (std::regex_match(name, expressions_[i])) {
                return IgnoreReason{fromUtf8(name), rules_[i], i + 1};
            }
        }
        return name.front() == '.' ? std::optional(IgnoreReason{fromUtf8(name), {}, 0}) : std::nullopt;
    }

private:
    std::vector<OdString> rules_;
    std::vector<std::regex> expressions_;
};

/// Without the folders whose names no rule applies to.
std::string withoutPropertiesFolder(std::string const& path)
{
    std::string const folder = ".tav/properties/";
    return path.compare(0, folder.size(), folder) == 0 ? path.substr(folder.size()) : path;
}

bool hasName(common::RootPath const& root, std::function<bool(std::string const& name)> const& isMeant)
{
    auto const isMatch = [&](OdString const& path) {
        return isMeant(std::filesystem::path(path.ansi_str()).filename().string());
    };
    common::CollectOptions const everything(true, true, false, {});
    common::DirContents const contents = common::collectDirContents(root.path(), everything);
    return std::any_of(contents.files.begin(), contents.files.end(), isMatch) ||
           std::any_of(contents.dirs.begin(), contents.dirs.end(), isMatch);
}

} // namespace

std::optional<IgnoreReason> whyIgnored(common::RootPath const& root, OdString const& path)
{
    RuleFinder const finder(ignoreRules(root));
    for (std::filesystem::path const& part : std::filesystem::path(withoutPropertiesFolder(path.ansi_str()))) {
        if (auto reason = finder.whyIgnored(part.string())) {
            return reason;
        }
    }
    return std::nullopt;
}

bool matchesAnyName(common::RootPath const& root, OdString const& rule)
{
    std::regex const expression = common::RepoIgnore::compile(rule);
    return hasName(root, [&](std::string const& name) { return std::regex_match(name, expression); });
}

bool isAnyName(common::RootPath const& root, std::string const& name)
{
    return hasName(root, [&](std::string const& other) { return other == name; });
}

std::size_t countMatches(std::vector<OdString> const& paths, OdString const& rule)
{
    std::regex const expression = common::RepoIgnore::compile(rule);
    return static_cast<std::size_t>(std::count_if(paths.begin(), paths.end(), [&](OdString const& path) {
        std::filesystem::path const parts = withoutPropertiesFolder(path.ansi_str());
        return std::any_of(parts.begin(), parts.end(), [&](std::filesystem::path const& part) {
            return std::regex_match(part.string(), expression);
        });
    }));
}

} // namespace tav
