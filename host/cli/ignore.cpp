#include "host/cli/commands.h"
#include "host/cli/output.h"
#include "host/errors/failure.h"
#include "host/repository/ignore_file.h"
#include "host/repository/open.h"
#include "host/session/write_session.h"
#include "host/text/utf8.h"

#include <string>

namespace tav {

namespace {

void addRule(common::RootPath const& root, std::string const& rule)
{
    WriteSession const session(root, "ignore", Recovery::attempted);
    OdString const pattern = fromUtf8(rule);
    report(
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
            print(shownLine(rule) + "\n");
        }
    }
    if (json) {
        printJson(array);
    }
}

} // namespace

void ignore(IgnoreOptions const& options)
{
    common::RootPath const root = openRepository("");
    if (options.rule) {
        addRule(root, *options.rule);
    } else {
        listRules(root, options.json);
    }
}

} // namespace tav
