#include "host/user/projects.h"
#include "host/cli/commands.h"
#include "host/cli/output.h"
#include "host/errors/failure.h"
#include "host/text/utf8.h"

#include <filesystem>
#include <string>
#include <vector>

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

void list(common::ConfigData const& data)
{
    for (auto const& [path, project] : data.projects) {
        print(shown(project.name) + "  " + shown(path) + "\n");
    }
    if (data.projects.empty()) {
        print("No project is known yet; 'tav init' adds one.\n");
    }
}

OdString absolute(std::string const& typed)
{
    std::filesystem::path const path = std::filesystem::absolute(typed).lexically_normal();
    return fromUtf8((path.has_filename() ? path : path.parent_path()).string());
}

std::vector<OdString> pathsOfProjects(common::ConfigData const& data, std::string const& name)
{
    std::vector<OdString> paths;
    for (auto const& [path, project] : data.projects) {
        if (project.name == fromUtf8(name)) {
            paths.push_back(path);
        }
    }
    return paths;
}

/// The path of the project that `typed` means.
OdString find(common::ConfigData const& data, std::string const& typed)
{
    if (!typed.empty() && data.projects.count(absolute(typed)) > 0) {
        return absolute(typed);
    }
    std::vector<OdString> const paths = pathsOfProjects(data, typed);
    if (paths.empty()) {
        throw Failure("No project is called '" + typed + "'.", "Run 'tav projects' to see those that there are.");
    }
    if (paths.size() > 1) {
        Failure failure("Several projects are called '" + typed + "'.", "Give the path of one:");
        for (OdString const& path : paths) {
            failure.details.push_back(path.ansi_str());
        }
        throw failure;
    }
    return paths.front();
}

void forget(common::ConfigData const& data, std::string const& typed)
{
    OdString const path = find(data, typed);
    forgetProject(path);
    report(
        "Took '" + shown(data.projects.at(path).name) + "' in '" + shown(path) +
        "' off the list. Its folder and its history stay.\n");
}

} // namespace

void projects(ProjectsOptions const& options)
{
    common::ConfigData const data = readProjects();
    if (options.forgotten) {
        forget(data, *options.forgotten);
    } else if (options.json) {
        printDocument(data);
    } else {
        list(data);
    }
}

} // namespace tav
