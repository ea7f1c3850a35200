#include "host/repository/open.h"

#include "host/failure.h"
#include "host/text/wide.h"

#include <filesystem>

namespace tav {

namespace {

namespace fs = std::filesystem;

constexpr char const* kHowToInit = "Run 'tav init' in the folder of your drawings to make it one.";

fs::path currentFolder()
{
    std::error_code error;
    fs::path current = fs::current_path(error);
    if (error) {
        throw Failure("The current folder does not exist any more.", "Change to another folder and try again.");
    }
    return current;
}

} // namespace

common::RootPath openRepository(std::string const& folder)
{
    if (!folder.empty()) {
        return valueOrFail(common::RootPath::get(wide(folder), false), kHowToInit);
    }
    fs::path const start = currentFolder();
    for (fs::path place = start;; place = place.parent_path()) {
        auto const found = common::RootPath::get(wide(place.string()), false);
        if (found.hasValue()) {
            return found.value();
        }
        if (place == place.parent_path()) {
            return valueOrFail(common::RootPath::get(wide(start.string()), false), kHowToInit);
        }
    }
}

} // namespace tav
