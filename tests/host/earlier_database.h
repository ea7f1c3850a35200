/// Databases of working folders as earlier versions of tav made them.
#pragma once

#include "host/database/sqlite.h"

#include <string>

namespace host_tests {

/// Makes of the database file `path` what the second version of its tables was; `noted` is what a command has begun.
inline void makeSecondVersion(std::string const& path, OdString const& noted)
{
    tav::Database database(path);
    for (char const* const table :
         {"shelf_renames", "shelf_staging", "shelf_files", "shelves", "operation_files", "operation_staging",
          "operation_renames", "operations", "pending_begun", "pending_contents", "pending_files"}) {
        database.run(("DROP TABLE " + std::string(table)).c_str());
    }
    database.run("DROP INDEX changes_by_path; DROP TABLE last_changes");
    tav::Statement row = database.prepare("INSERT OR REPLACE INTO settings VALUES ('unfinished', ?)");
    row.with(noted).run();
    database.setVersion(2);
}

} // namespace host_tests
