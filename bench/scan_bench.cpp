// Looking through the working folder beside git, and reading a large file beside openssl.
#include "bench/race.h"
#include "bench/scratch.h"
#include "common/mu_common_file_utils.h"
#include "common/mu_common_repo_files.h"

#include <clocale>
#include <cstdio>
#include <string>
#include <vector>

namespace {

using bench::check;
using bench::Scratch;
using bench::Table;
using common::RootPath;

RootPath rootAt(std::string const& folder)
{
    return RootPath(OdString(folder.c_str(), CP_UTF_8));
}

/// One rule as an expression and as a pattern of git's.
struct Rule {
    std::string expression;
    std::string pattern;
};

std::vector<Rule> defaultRules()
{
    return {{R"(^.*\.bak$)", "*.bak"}, {R"(^.*\.dwl$)", "*.dwl"}, {R"(^.*\.dwl2$)", "*.dwl2"}};
}

/// What large ignore files hold: mostly endings, some beginnings, names and middles, a few with a class.
std::vector<Rule> fiftyRules()
{
    std::vector<Rule> rules;
    for (char const* ending : {"bak", "dwl",  "dwl2",       "sv",    "tmp",      "log",     "err",    "ac",   "dmp",
                               "plt", "pc3",  "xlg",        "adsk",  "cache",    "lock",    "old",    "orig", "rej",
                               "swp", "part", "crdownload", "thumb", "autosave", "recover", "journal"}) {
        rules.push_back({R"(^.*\.)" + std::string(ending) + "$", "*." + std::string(ending)});
    }
    for (char const* beginning :
         {"tmp", "temp-", "copy of ", "backup", "~", "draft-", "private", "old-", "test-", "x-"}) {
        rules.push_back({"^" + std::string(beginning) + ".*$", std::string(beginning) + "*"});
    }
    for (char const* name : {"plot", "build", "output", "archive", "Thumbs\\.db", "desktop\\.ini", "node"}) {
        rules.push_back({"^" + std::string(name) + "$", name});
    }
    for (char const* middle : {"recovered", "conflicted", "autosave"}) {
        rules.push_back({"^.*" + std::string(middle) + ".*$", "*" + std::string(middle) + "*"});
    }
    rules.push_back({R"(^.*\.sv[0-9]$)", "*.sv[0-9]"});
    rules.push_back({R"(^.*_[0-9]_[0-9]\.dwg$)", "*_[0-9]_[0-9].dwg"});
    rules.push_back({R"(^acad[0-9].*$)", "acad[0-9]*"});
    rules.push_back({R"(^.*\.[bB][aA][kK][0-9]$)", "*.[bB][aA][kK][0-9]"});
    rules.push_back({R"(^plot-[0-9][0-9].*$)", "plot-[0-9][0-9]*"});
    return rules;
}

void scan(
    Table const& table, std::string const& what, std::string const& data, std::string const& folder,
    std::vector<Rule> const& rules, double target)
{
    std::string expressions;
    std::string patterns = ".tav\n";
    for (Rule const& rule : rules) {
        expressions += rule.expression + "\n";
        patterns += rule.pattern + "\n";
    }
    bench::writeFile(folder + "/.tav/properties/ignore", expressions);
    bench::writeFile(folder + "/.git/info/exclude", patterns);
    RootPath const root = rootAt(folder);
    table.race(
        {what, data}, {"collectRepoFiles", [&] { check(common::collectRepoFiles(root).hasValue(), "no files"); }},
        {{{"git ls-files -o",
           [&] {
               bench::runCommand(bench::git(folder, {"ls-files", "-o", "--exclude-standard"}));
           }},
          target}});
}

void raceScans(Table const& table, int files)
{
    Scratch const scratch;
    std::string const folder = scratch.pathTo("tree");
    std::string const data = bench::grouped(files) + " files, a hundred a folder";
    bench::makeDrawings(folder, files);
    bench::runCommand(bench::git(folder, {"init", "-q"}));
    scan(table, "collectRepoFiles", data, folder, defaultRules(), 0.8);
    if (!table.scaling()) {
        scan(table, "collectRepoFiles, 50 rules", data, folder, fiftyRules(), 1.5);
    }
}

void raceDigests(Table const& table)
{
    int const megabytes = table.sizes(1024).front();
    Scratch const scratch;
    std::string content(1 << 20, '\0');
    for (std::size_t i = 0; i < content.size(); ++i) {
        content[i] = static_cast<char>(i * i >> 5);
    }
    std::string const path = scratch.pathTo("large.dwg");
    std::FILE* const file = std::fopen(path.c_str(), "wb");
    for (int i = 0; i < megabytes; ++i) {
        check(std::fwrite(content.data(), content.size(), 1, file) == 1, "the large file is not written");
    }
    std::fclose(file);
    RootPath const root = rootAt(scratch.pathTo(""));
    table.race(
        {"isDifferent", "a file of " + std::to_string(megabytes) + " MiB, warm"},
        {"isDifferent", [&] { check(common::isDifferent(L"large.dwg", L"sha0", root), "equal"); }},
        {{{"openssl dgst -sha256",
           [&] {
               bench::runCommand({"openssl", "dgst", "-sha256", path});
           }},
          1.0}});
}

} // namespace

int main(int argc, char** argv)
{
    std::setlocale(LC_ALL, "C.UTF-8");
    Table const table(argc, argv);
    for (int const files : table.sizes(200'000)) {
        raceScans(table, files);
    }
    if (!table.scaling()) {
        raceDigests(table);
    }
}
