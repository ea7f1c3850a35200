#include "host/storage/storage_layout.h"

namespace tav {

namespace {

constexpr std::string_view kStoreEnd = ".tf";
constexpr std::string_view kNewFormEnd = ".tf.new";

bool endsWith(std::string_view text, std::string_view end)
{
    return text.size() >= end.size() && text.substr(text.size() - end.size()) == end;
}

} // namespace

StorageLayout::StorageLayout(common::RootPath const& root)
    : tavFolder_(root.tavPath().ansi_str())
    , storeFolder_(tavFolder_ + "/" + common::repositoryExt().ansi_str())
    , objectFolder_(tavFolder_ + "/objects")
    , incomingFolder_(objectFolder_ + "/incoming")
    , restoringFolder_(tavFolder_ + "/restoring")
{
}

std::string StorageLayout::fileOf(StorageUrl const& url) const
{
    return url.isObject() ? objectFolder_ + "/" + hexOf(url.digest)
                          : storeFolder_ + "/" + url.store + std::string(kStoreEnd);
}

std::string StorageLayout::incomingFileOf(Digest const& digest) const
{
    return incomingFolder_ + "/" + hexOf(digest);
}

std::optional<std::string> StorageLayout::storeIn(std::string_view name)
{
    if (!endsWith(name, kStoreEnd)) {
        return std::nullopt;
    }
    std::string_view const store = name.substr(0, name.size() - kStoreEnd.size());
    return isStoreName(store) ? std::optional<std::string>(store) : std::nullopt;
}

bool StorageLayout::isNewForm(std::string_view name)
{
    return endsWith(name, kNewFormEnd);
}

std::string StorageLayout::newFormOf(std::string const& path)
{
    return path + ".new";
}

std::string nameOfStore(std::string const& store)
{
    return "The revision store '" + store + "'";
}

} // namespace tav
