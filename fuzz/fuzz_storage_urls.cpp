// A storage URL of any bytes names the revision and the place that the standard library's expressions find in it.
#include "common/mu_common_file_storage.h"

#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <regex>
#include <string>

namespace {

constexpr std::size_t kLongest = 1000; // The standard library's matcher recurses through the text.
std::string const kNone = "\n";        // A revision or place has no line end.

void require(bool holds)
{
    if (!holds) {
        std::abort();
    }
}

std::string inBytes(Expected<OdString> const& result)
{
    return result.hasValue() ? result.value().ansi_str() : kNone;
}

std::string firstGroup(std::string const& url, char const* form)
{
    std::smatch match;
    return url.substr(0, 2) == "tf" && std::regex_match(url, match, std::regex(form)) ? match[1].str() : kNone;
}

void checkDrawing(std::string const& url, common::RootPath const& root, OdString const& wide)
{
    require(inBytes(common::getRevision(wide)) == firstGroup(url, ".*#(.*)"));
    std::string const name = firstGroup(url, "tf:(.*?)#.*");
    std::string const place = name == kNone ? kNone : "/r/.tav/tf/" + name + ".tf";
    require(inBytes(common::getStoragePath(root, wide)) == place);
}

void checkObject(common::RootPath const& root, OdString const& wide)
{
    std::string const hash = wide.right(64).ansi_str();
    require(inBytes(common::getRevision(wide)) == hash);
    require(inBytes(common::getStoragePath(root, wide)) == "/r/.tav/objects/" + hash);
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(std::uint8_t const* data, std::size_t size)
{
    std::string const url(reinterpret_cast<char const*>(data), size);
    OdString const wide(url.data(), url.size(), CP_UTF_8);
    common::RootPath const root(L"/r");
    bool const isDrawing = url.substr(0, 2) == "tf";
    require((common::urlToType(wide) == common::StorageType::Tf) == isDrawing);
    static_cast<void>(common::fileToType(wide));
    if (url.substr(0, 2) == "po") {
        checkObject(root, wide);
    } else if (size <= kLongest) {
        checkDrawing(url, root, wide);
    } else {
        require(isDrawing || !common::getRevision(wide).hasValue());
    }
    return 0;
}
