#include "host/cli/commands.h"
#include "host/cli/output.h"
#include "host/failure.h"
#include "host/repository/ignore_file.h"
#include "host/repository/lock.h"
#include "host/repository/open.h"
#include "host/text/wide.h"

#include <memory>
#include <string>

namespace tav {

namespace {

struct Options {
    std::string rule;
    bool json = false;
};

void addRule(common::RootPath const& root, std::string const& rule)
{
    os::FileLock const lock = lockRepository(root, "ignore");
    OdString const pattern = wide(rule);
    print(
        addIgnoreRule(root, pattern) ? "Names that match '" + shown(pattern) + "' are ignored from now on.\n"
                                     : "The rule '" + shown(pattern) + "' was there already.\n");
}

void listRules(common::RootPath const& root, bool json)
{
    kutils::json::Array array;
    for (OdString const& rule : ignoreRules(root)) {
        if (json) {
            array.push_back(jsonText(rule));
        } else {
            print(shown(rule) + "\n");
        }
    }
    if (json) {
        printJson(array);
    }
}

} // namespace

void addIgnore(CLI::App& app)
{
    CLI::App* const command = app.add_subcommand("ignore", "Show the rules for names to ignore, or add one");
    auto const options = std::make_shared<Options>();
    CLI::Option* const add = command->add_option(
        "--add", options->rule, "A regular expression; files and folders whose whole name matches it are ignored");
    command->add_flag("--json", options->json, "Print a document for programs")->excludes(add);
    add->type_name("PATTERN");
    command->callback([options, add] {
        common::RootPath const root = openRepository("");
        if (add->count() > 0) {
            addRule(root, options->rule);
        } else {
            listRules(root, options->json);
        }
    });
}

} // namespace tav
