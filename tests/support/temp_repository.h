/// A repository that lives as long as a test.
#pragma once

#include "common/mu_common_repo_prop.h"

#include "tests/support/temp_folder.h"

#include <initializer_list>
#include <string_view>

namespace support {

/// A new folder with an empty ".tav" in it. Names are relative to the working folder, so ".tav/tav.state" is the state
/// file; what `TempFolder` offers is there for the rest.
class TempRepository : public TempFolder {
public:
    TempRepository() { makeFolder(".tav"); }

    common::RootPath root() const { return common::RootPath(widePath()); }

    /// Makes empty files of the working folder, with their folders.
    void add(std::initializer_list<std::string_view> names) const
    {
        for (std::string_view const name : names) {
            write(name, "");
        }
    }

    /// Makes empty files in the conflict folder.
    void addConflictCopies(std::initializer_list<std::string_view> names) const
    {
        for (std::string_view const name : names) {
            write(std::string(".tav/conflict/").append(name), "");
        }
    }

    /// Writes the ignore file as it stands here.
    void ignore(std::string_view content) const { write(".tav/properties/ignore", content); }
};

} // namespace support
