#include "host/changes/staging.h"
#include "host/cli/commands.h"
#include "host/cli/output.h"
#include "host/cli/typed_command.h"
#include "host/errors/failure.h"
#include "host/repository/log_entry.h"
#include "host/repository/names.h"
#include "host/repository/open.h"
#include "host/repository/working_state.h"
#include "host/session/write_session.h"
#include "host/text/plural.h"

#include <optional>
#include <string>
#include <vector>

namespace tav {

void unstageFiles(UnstageOptions const& options)
{
    WriteSession session(openRepository(""), "unstage", Recovery::attempted);
    common::RootPath const& root = session.root();
    std::size_t count = 0;
    std::optional<LogEntry> entry;
    changeState(root, [&](common::Cache& cache) {
        entry.emplace(session.database(), typedCommand("unstage", options.names, options.all), cache.read());
        NameFinder const finder(cache.read().stagedFiles, root);
        std::vector<common::StagedFile> chosen = options.all ? finder.all() : std::vector<common::StagedFile>();
        for (std::string const& name : options.names) {
            std::vector<common::StagedFile> const found = finder.find(name);
            if (found.empty()) {
                throw Failure("No staged file matches '" + name + "'.", "Run 'tav status' to see what is staged.");
            }
            chosen.insert(chosen.end(), found.begin(), found.end());
        }
        count = unstage(chosen, cache.write());
        entry->write(cache.read());
    });
    entry->keep();
    report("Took " + counted(count, "file") + " out of the next commit.\n");
}

} // namespace tav
