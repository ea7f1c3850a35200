#include "host/projects.h"
#include "host/cli/commands.h"
#include "host/cli/output.h"

#include <memory>

namespace tav {

namespace {

void printDocument(common::ConfigData const& data)
{
    kutils::json::Array array;
    for (auto const& [path, project] : data.projects) {
        kutils::json::Object object;
        object[L"path"] = jsonText(path);
        object[L"name"] = jsonText(project.name);
        object[L"id"] = jsonText(project.cloud);
        array.emplace_back(std::move(object));
    }
    printJson(std::move(array));
}

void listProjects(bool json)
{
    common::ConfigData const data = readProjects();
    if (json) {
        printDocument(data);
        return;
    }
    for (auto const& [path, project] : data.projects) {
        print(shown(project.name) + "  " + shown(path) + "\n");
    }
    if (data.projects.empty()) {
        print("No project is known yet; 'tav init' adds one.\n");
    }
}

} // namespace

void addProjects(CLI::App& app)
{
    CLI::App* const command = app.add_subcommand("projects", "List the repositories that you have made");
    auto const json = std::make_shared<bool>(false);
    command->add_flag("--json", *json, "Print a document for programs");
    command->callback([json] { listProjects(*json); });
}

} // namespace tav
