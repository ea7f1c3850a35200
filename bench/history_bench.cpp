// The history of a file, and the last commit of each file, beside git.
#include "bench/race.h"
#include "bench/scratch.h"

#include "host/history/commit_tables.h"
#include "host/repository/local_database.h"
#include "host/text/utf8.h"

#include <algorithm>
#include <cstdio>
#include <fstream>
#include <random>
#include <string>
#include <vector>

namespace {

using bench::check;
using bench::Scratch;
using bench::Table;

constexpr std::int64_t kFirstDate = 1'600'000'000;

std::string pathOf(int file)
{
    char text[64];
    std::snprintf(
        text, sizeof text, "project-%02d/building-%02d/drawing-%02d.dwg", file / 10'000, file / 100 % 100, file % 100);
    return text;
}

/// A history that is written for both sides: the tables of a working folder, and a stream for git.
class History {
public:
    explicit History(std::string const& folder) : folder_(folder)
    {
        bench::runCommand({TAV_PROGRAM, "init", folder});
        bench::runCommand(bench::git(folder, {"init", "-q", "-b", "master"}));
    }

    /// A first commit of all `files`, and then others of twenty each.
    void make(int files, int commits)
    {
        tav::LocalDatabase database = tav::LocalDatabase::openForChanges(common::RootPath(tav::fromUtf8(folder_)));
        tav::WriteTransaction transaction(database.database());
        std::ofstream stream(folder_ + "/stream");
        std::mt19937 random; // NOLINT: the same history in each run
        for (int number = 1; number <= commits; ++number) {
            std::vector<int> changed;
            for (int i = 0; i < (number == 1 ? files : 20); ++i) {
                changed.push_back(number == 1 ? i : static_cast<int>(random() % static_cast<unsigned>(files)));
            }
            std::sort(changed.begin(), changed.end());
            changed.erase(std::unique(changed.begin(), changed.end()), changed.end());
            add(number, changed, database, stream);
        }
        database.commits().set({L"master", hashOf(commits), common::EType::branch});
        database.setCurrentCommit(hashOf(commits));
        transaction.commit();
        stream.close();
        bench::runCommand(bench::git(folder_, {"fast-import", "--quiet"}), folder_ + "/stream");
        bench::runCommand(bench::git(folder_, {"read-tree", "master"}));
    }

private:
    static OdString hashOf(int number) { return OdString().format(L"%064d", number); }

    static void add(int number, std::vector<int> const& changed, tav::LocalDatabase& database, std::ostream& stream)
    {
        std::int64_t const date = kFirstDate + number * 3'600;
        std::string const message = "Moves the stairs of building " + std::to_string(number);
        stream << "commit refs/heads/master\ncommitter ann <ann@studio> " << date << " +0000\ndata " << message.size()
               << "\n"
               << message << "\n";
        std::vector<tav::FileRecord> records;
        for (int const file : changed) {
            std::string const version = std::to_string(file) + " in commit " + std::to_string(number);
            records.push_back(
                {tav::fromUtf8(pathOf(file)), OdString().format(L"po:%032d%032d", file, number), OdString()});
            stream << "M 100644 inline " << pathOf(file) << "\ndata " << version.size() << "\n" << version << "\n";
        }
        std::vector<OdString> parents;
        if (number > 1) {
            parents.push_back(hashOf(number - 1));
        }
        database.commits().addChanges(
            {number, hashOf(number), L"ann@studio", tav::fromUtf8(message), date, parents}, records);
    }

    std::string folder_;
};

void race(
    Table const& table, std::string const& what, std::string const& data, std::vector<std::string> const& ours,
    std::vector<std::string> const& theirs, std::string const& peer, double target)
{
    table.race(
        {what, data}, {what, [&] { bench::runCommand(ours); }}, {{{peer, [&] { bench::runCommand(theirs); }}, target}});
}

} // namespace

int main(int argc, char** argv)
{
    Table const table(argc, argv);
    if (table.scaling()) {
        return 0;
    }
    Scratch const scratch;
    setenv("XDG_DATA_HOME", scratch.pathTo("data").c_str(), 1); // What the user has stays as it is.
    setenv("XDG_CONFIG_HOME", scratch.pathTo("config").c_str(), 1);
    int const commits = table.sizes(10'000).front();
    std::string const file = pathOf(3);

    std::string const few = scratch.pathTo("few");
    History(few).make(20, commits);
    std::string const data = bench::grouped(commits) + " commits";
    race(
        table, "tav log NAME", data + " of 20 files", {TAV_PROGRAM, "-C", few, "log", file},
        bench::git(few, {"log", "--", file}), "git log -- NAME", 1.0);

    int const files = table.sizes(200'000).front();
    std::string const many = scratch.pathTo("many");
    History(many).make(files, commits);
    race(
        table, "tav log NAME", data + ", " + bench::grouped(files) + " files", {TAV_PROGRAM, "-C", many, "log", file},
        bench::git(many, {"log", "--", file}), "git log -- NAME", 1.0);
    race(
        table, "tav files --long", bench::grouped(files) + " files", {TAV_PROGRAM, "-C", many, "files", "--long"},
        bench::git(many, {"ls-files"}), "git ls-files", 2.0);
}
