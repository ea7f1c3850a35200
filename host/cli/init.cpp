#include "host/cli/commands.h"
#include "host/cli/output.h"
#include "host/failure.h"
#include "host/projects.h"
#include "host/repository/ignore_file.h"
#include "host/repository/open.h"
#include "host/repository/server_of.h"
#include "host/repository/work.h"
#include "host/repository/working_state.h"
#include "host/text/characters.h"
#include "host/text/wide.h"

#include "common/mu_common_serialization.h"
#include "json/json_reader.h"

#include <algorithm>
#include <filesystem>
#include <string>

namespace tav {

namespace {

std::string absolute(std::string const& folder)
{
    std::filesystem::path const path = std::filesystem::absolute(folder).lexically_normal();
    return path.has_filename() ? path.string() : path.parent_path().string();
}

/// The server takes names that can be shown.
OdString withoutControls(OdString const& name)
{
    OdString clean;
    for (std::size_t i = 0; i < name.getLength(); ++i) {
        clean += isControl(name.getAt(i)) ? L'_' : name.getAt(i);
    }
    return clean;
}

OdString documentOf(std::string const& name)
{
    kutils::json::Object object;
    object[L"name"] = jsonText(withoutControls(wide(name)));
    return compactText(std::move(object));
}

/// Makes a repository on the server and returns its identifier.
OdString registerAt(OdString const& server, std::string const& name)
{
    OdString const answer = valueOrFail(
        connect(server, EmbeddedServer::Missing::isMade)->request(L"init", documentOf(name)),
        "Check the folder of the server.");
    kutils::json::Value document;
    kutils::json::read_string(document, answer);
    return valueOrFail(common::deserializeInitData(document.get_object()), "Check the folder of the server.");
}

/// What lies in the working folder is versioned with it, unless it is hidden: going back to an earlier commit would
/// take the server back too.
void failIfInside(std::string const& server, std::string const& workingFolder)
{
    std::filesystem::path const relative =
        std::filesystem::weakly_canonical(server).lexically_relative(std::filesystem::weakly_canonical(workingFolder));
    auto const isHidden = [](std::filesystem::path const& part) { return part.string().front() == '.'; };
    if (std::none_of(relative.begin(), relative.end(), isHidden)) {
        throw Failure("'" + server + "' lies in the working folder.", "Name a folder outside of it for the server.");
    }
}

void chooseServer(
    LocalDatabase& database, InitOptions const& options, std::string const& folder, std::string const& name)
{
    OdString const chosen = wide(absolute(options.server.empty() ? defaultServerFolder() : options.server));
    if (database.repositoryId().isEmpty()) {
        failIfInside(chosen.ansi_str(), folder);
        database.setServer(chosen, registerAt(chosen, name));
    } else if (!options.server.empty() && database.serverFolder() != chosen) {
        throw Failure(
            "The repository has its server already, in '" + database.serverFolder().ansi_str() + "'.",
            "Run 'tav init' without --server.");
    }
}

/// The list of projects is a convenience: without it the repository is as good.
void enterProject(LocalDatabase const& database, std::string const& folder, std::string const& name)
{
    try {
        addProject(wide(folder), wide(name), database.repositoryId());
    } catch (Failure const& failure) {
        printNote("The repository is complete, but 'tav projects' does not know it: " + failure.what);
    }
}

} // namespace

void init(InitOptions const& options)
{
    OdString const path = wide(options.folder);
    bool const existed = common::RootPath::get(path, false).hasValue();
    common::RootPath const root =
        valueOrFail(common::RootPath::get(path, true), "Check that the folder is one and that you may write there.");
    requireOwnFiles(root);
    std::string const folder = absolute(options.folder);
    std::string const name = std::filesystem::path(folder).filename().string();
    os::FileLock const lock = lockRepository(root, "init");
    makeIgnoreFile(root);
    makeState(root);
    LocalDatabase database = LocalDatabase::make(root);
    chooseServer(database, options, folder, name);
    enterProject(database, folder, name);
    print(
        existed ? "The repository in '" + shown(path) + "' was there already; it is complete.\n"
                : "Made a repository in '" + shown(path) + "'.\n");
}

} // namespace tav
