#include "host/user/projects.h"
#include "host/cli/commands.h"
#include "host/cli/output.h"

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

} // namespace

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

} // namespace tav
