#include "host/cli/commands.h"
#include "host/cli/output.h"
#include "host/errors/failure.h"
#include "host/repository/ignore_file.h"
#include "host/repository/ignore_pattern.h"
#include "host/repository/ignore_reason.h"
#include "host/repository/names.h"
#include "host/repository/open.h"
#include "host/repository/working_state.h"
#include "host/session/write_session.h"
#include "host/text/plural.h"
#include "host/text/utf8.h"

#include <algorithm>
#include <optional>
#include <regex>
#include <set>
#include <string>
#include <vector>

namespace tav {

namespace {

bool isInEffect(common::RootPath const& root, OdString const& rule)
{
    std::vector<OdString> const rules = ignoreRules(root);
    return std::find(rules.begin(), rules.end(), rule) != rules.end();
}

bool add(common::RootPath const& root, OdString const& rule, bool dryRun)
{
    requireValidRule(rule);
    if (dryRun) {
        return !isInEffect(root, rule);
    }
    WriteSession const session(root, "ignore", Recovery::attempted);
    return addIgnoreRule(root, rule);
}

bool isMatch(std::string const& name, OdString const& rule)
{
    try {
        return std::regex_match(name, common::RepoIgnore::compile(rule));
    } catch (std::regex_error const&) {
        return false;
    }
}

/// A name that exists is meant as it is, whatever it would match as an expression.
OdString newRuleFor(std::string const& typed, common::RootPath const& root)
{
    OdString const rule = ruleFor(typed);
    return isMatch(typed, rule) || !isAnyName(root, typed) ? rule : ruleForName(typed);
}

void failForPath(std::string const& typed)
{
    if (typed.find('/') != std::string::npos) {
        throw Failure(
            "'" + typed + "' has a '/', and rules are for single names.",
            "Give the name of the file or folder alone, as in 'tav ignore --add old' for a folder 'plans/old'.");
    }
}

std::vector<OdString> controlledFiles(common::RootPath const& root)
{
    std::set<OdString> paths;
    LocalDatabase const database = LocalDatabase::open(root);
    for (auto const& [path, url] : database.commits().files(database.currentCommit())) {
        paths.insert(path);
    }
    auto const state = readState(root);
    for (common::StagedFile const& file : state->read().stagedFiles) {
        paths.insert(file.path);
    }
    return {paths.begin(), paths.end()};
}

void noteEffect(common::RootPath const& root, OdString const& rule)
{
    if (!matchesAnyName(root, rule)) {
        printNote("No file or folder has such a name yet.");
    }
    if (std::size_t const count = countMatches(controlledFiles(root), rule)) {
        printNote(
            "The rule is for new files: it does not apply to " + counted(count, "committed or staged file") +
            " with such a name.");
    }
}

void addRule(common::RootPath const& root, std::string const& typed, bool dryRun)
{
    failForPath(typed);
    OdString const rule = newRuleFor(typed, root);
    if (!add(root, rule, dryRun)) {
        report("The rule '" + shown(rule) + "' was there already.\n");
        return;
    }
    report("Names that match '" + shown(rule) + (dryRun ? "' would be ignored.\n" : "' are ignored from now on.\n"));
    noteEffect(root, rule);
}

bool remove(common::RootPath const& root, OdString const& rule, bool dryRun)
{
    if (dryRun) {
        return isInEffect(root, rule);
    }
    WriteSession const session(root, "ignore", Recovery::attempted);
    return removeIgnoreRule(root, rule);
}

/// A rule as it stands in the file goes before what a wildcard or a name means.
OdString existingRuleFor(std::string const& typed, common::RootPath const& root)
{
    for (OdString const& rule : {fromUtf8(typed), ruleFor(typed), ruleForName(typed)}) {
        if (isInEffect(root, rule)) {
            return rule;
        }
    }
    return ruleFor(typed);
}

void removeRule(common::RootPath const& root, std::string const& typed, bool dryRun)
{
    OdString const rule = existingRuleFor(typed, root);
    if (!remove(root, rule, dryRun)) {
        throw Failure("There is no rule '" + rule.ansi_str() + "'.", "Run 'tav ignore' to see the rules.");
    }
    report((dryRun ? "Would remove the rule '" : "Removed the rule '") + shown(rule) + "'.\n");
}

std::string sentence(IgnoreReason const& reason, common::RootPath const& root)
{
    std::string const name = "'" + shown(reason.name) + "'";
    if (reason.rule.isEmpty()) {
        return name + " is hidden: it begins with a dot.";
    }
    std::string const place = hasIgnoreFile(root)
                                  ? "Rule " + std::to_string(reason.number) + " of '" + kIgnoreFile + "'"
                                  : std::string("A rule that every repository begins with");
    return place + " matches " + name + ": " + shown(reason.rule);
}

bool isCommitted(common::RootPath const& root, OdString const& path)
{
    LocalDatabase const database = LocalDatabase::open(root);
    return database.commits().files(database.currentCommit()).count(path) > 0;
}

/// Rules are for new files: commits go on with those that they have.
void explain(common::RootPath const& root, std::string const& typed, bool json)
{
    OdString const path = pathInRepository(root, typed);
    std::optional<IgnoreReason> const reason = whyIgnored(root, path);
    bool const isIgnored = reason && !isCommitted(root, path);
    if (json) {
        kutils::json::Object document;
        document[L"path"] = jsonText(path);
        document[L"ignored"] = isIgnored;
        document[L"rule"] = jsonText(reason ? reason->rule : OdString());
        printJson(std::move(document));
    } else if (isIgnored) {
        print(sentence(*reason, root) + "\n");
    }
    if (!reason) {
        throw Failure("No rule ignores '" + path.ansi_str() + "'.", "Run 'tav ignore' to see the rules.");
    }
    if (!isIgnored) {
        throw Failure("'" + path.ansi_str() + "' is committed, so it is not ignored.", sentence(*reason, root));
    }
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
    if (options.added) {
        addRule(root, *options.added, options.dryRun);
    } else if (options.removed) {
        removeRule(root, *options.removed, options.dryRun);
    } else if (options.name) {
        explain(root, *options.name, options.json);
    } else {
        listRules(root, options.json);
    }
}

} // namespace tav
