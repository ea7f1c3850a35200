#include "host/cli/commands.h"
#include "host/cli/output.h"
#include "host/failure.h"
#include "host/repository/ignore_file.h"
#include "host/repository/lock.h"
#include "host/repository/working_state.h"

#include <memory>
#include <string>

namespace tav {

namespace {

void init(std::string const& folder)
{
    OdString const path(folder.data(), folder.size(), CP_UTF_8);
    bool const existed = common::RootPath::get(path, false).hasValue();
    common::RootPath const root =
        valueOrFail(common::RootPath::get(path, true), "Check that the folder is one and that you may write there.");
    os::FileLock const lock = lockRepository(root, "init");
    makeIgnoreFile(root);
    makeState(root);
    print(
        existed ? "The repository in '" + shown(path) + "' was there already; it is complete.\n"
                : "Made a repository in '" + shown(path) + "'.\n");
}

} // namespace

void addInit(CLI::App& app)
{
    CLI::App* const command = app.add_subcommand("init", "Make a folder of drawings a repository, or complete one");
    auto const folder = std::make_shared<std::string>(".");
    command->add_option("FOLDER", *folder, "The folder of your drawings; it is made when it is missing")
        ->capture_default_str();
    command->callback([folder] { init(*folder); });
}

} // namespace tav
