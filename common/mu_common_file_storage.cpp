#include "common/mu_common_file_storage.h"

#include "common/mu_common_translate.h"

#include "platform/ut/FileName.h"

#include <string>
#include <string_view>
#include <utility>

namespace common {

namespace {

constexpr std::size_t kHashLength = 64;

OdString wide(std::string_view text)
{
    return OdString(text.data(), text.size(), CP_UTF_8);
}

bool isObjectUrl(OdString const& url)
{
    return url.left(2) == OdString(L"po");
}

/// The forms of "tf" URLs are ".*#(.*)" and "tf:(.*?)#.*" in the narrow text, where a dot stands for any byte but a
/// line end. Looking for the '#' answers the same without a matcher that recurses through a long URL.
bool hasLineEnd(std::string_view url)
{
    return url.find_first_of("\r\n") != url.npos;
}

OdString join(OdString const& folder, OdString const& name)
{
    return folder + ut::FileName::getPathSeparator() + name;
}

} // namespace

StorageType urlToType(OdString const& url)
{
    return url.left(2) == repositoryExt() ? StorageType::Tf : StorageType::Object;
}

StorageType fileToType(OdString const& path)
{
    return ut::FileName(path).getExt().compare(L"dwg") == 0 ? StorageType::Tf : StorageType::Object;
}

Expected<OdString> getRevision(OdString const& url)
{
    std::string const narrow = url.ansi_str();
    std::size_t const mark = narrow.rfind('#');
    if (urlToType(url) == StorageType::Tf && mark != narrow.npos && !hasLineEnd(narrow)) {
        return wide(std::string_view(narrow).substr(mark + 1));
    }
    if (isObjectUrl(url)) {
        return url.right(kHashLength);
    }
    return ErrorMessage(translate(L"Internal error, invalid url occur: %ls"), url.c_str());
}

Expected<OdString> getStoragePath(RootPath const& root, OdString const& url)
{
    constexpr std::string_view kStart = "tf:";
    std::string const narrow = url.ansi_str();
    std::size_t const mark = narrow.find('#');
    if (narrow.compare(0, kStart.size(), kStart) == 0 && mark != narrow.npos && !hasLineEnd(narrow)) {
        OdString const name = wide(std::string_view(narrow).substr(kStart.size(), mark - kStart.size()));
        return ut::FileName(join(root.tavPath(), repositoryExt()), name, repositoryExt()).getFullPath();
    }
    if (isObjectUrl(url)) {
        return join(join(root.tavPath(), L"objects"), url.right(kHashLength));
    }
    return ErrorMessage(translate(L"invalid url: %ls"), url.c_str());
}

FileStorage::~FileStorage() = default;

WriteOutcome FileStorage::merge(
    OdString const& first, OdString const& second, OdString const& /*third*/, OdString fourth, RootPath const& root,
    IoInterface const& io)
{
    if (!io.accept(first)) {
        return WriteOutcome(std::in_place);
    }
    Expected<bool> const merged = mergeFromStorage(root, fourth, second);
    if (!merged.hasValue()) {
        return merged.error();
    }
    if (!merged.value()) {
        return ErrorMessage(translate(L"Could not find %ls in the storage"), second.c_str());
    }
    return WriteOutcome(std::in_place);
}

} // namespace common
