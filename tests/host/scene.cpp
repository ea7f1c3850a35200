#include "tests/host/scene.h"

#include "tests/host/run_here.h"
#include "tests/host/sqlite_calls.h"

#include "host/changes/digest.h"
#include "host/changes/folder_view.h"
#include "host/repository/local_database.h"
#include "host/repository/working_state.h"
#include "host/storage/local_storage.h"
#include "host/text/utf8.h"
#include "platform/os/os_calls.h"

#include <algorithm>
#include <array>
#include <cstdio>
#include <cstdlib>
#include <fcntl.h>
#include <filesystem>
#include <functional>
#include <iterator>
#include <optional>
#include <random>
#include <regex>
#include <sstream>
#include <sys/stat.h>
#include <utility>

namespace host_tests {
namespace {

namespace fs = std::filesystem;

constexpr time_t kLongAgo = 1'500'000'000;

void require(bool succeeded, char const* step)
{
    if (!succeeded) {
        std::fprintf(stderr, "Scene: cannot %s\n", step);
        std::abort();
    }
}

void doNotWaitForTheDisk()
{
    os::calls().fsync = [](int) { return 0; };
    os::calls().syncfs = [](int) { return 0; };
}

void setTimes(std::string const& path, timespec const& time)
{
    std::array<timespec, 2> const times = {time, time};
    require(utimensat(AT_FDCWD, path.c_str(), times.data(), 0) == 0, "set a time");
}

timespec timeOf(std::string const& path)
{
    struct stat status;
    require(stat(path.c_str(), &status) == 0, "examine a file");
    return status.st_mtim;
}

std::vector<std::string> linesOf(std::string const& text)
{
    std::vector<std::string> lines;
    std::istringstream stream(text);
    for (std::string line; std::getline(stream, line);) {
        lines.push_back(line);
    }
    std::sort(lines.begin(), lines.end());
    return lines;
}

/// Times included.
void copyTree(std::string const& from, std::string const& to)
{
    fs::copy(from, to, fs::copy_options::recursive);
    for (fs::directory_entry const& entry : fs::recursive_directory_iterator(from)) {
        std::string const path = entry.path().string();
        setTimes(to + path.substr(from.size()), timeOf(path));
    }
}

std::optional<std::string> contentIn(Files const& files, std::string const& path)
{
    auto const file = files.find(path);
    return file == files.end() ? std::nullopt : std::optional(file->second);
}

/// Each item of the lists in one line.
std::string withoutTimes(std::string const& state)
{
    static std::regex const time("\"last_checked\" : [0-9]+");
    static std::regex const insideOfItem("\n {9,}");
    return std::regex_replace(std::regex_replace(state, time, "..."), insideOfItem, " ");
}

/// The rows of a table, as one expression shows them.
std::string rowsOf(tav::Database const& database, std::string const& table, std::string const& columns)
{
    tav::Statement rows = database.prepare(("SELECT " + columns + " FROM " + table + " ORDER BY 1").c_str());
    std::string text = table + "\n";
    while (rows.next()) {
        text += "    " + rows.text(0).ansi_str() + "\n";
    }
    return text;
}

std::string commitsIn(tav::Database const& database)
{
    return rowsOf(database, "commits", "number || ' ' || hash || ' ' || author || ' ' || message") +
           rowsOf(database, "parents", "number || ' ' || parent") +
           rowsOf(database, "changes", "number || ' ' || path || ' ' || url || ' ' || previous_path") +
           rowsOf(database, "refs", "name || ' ' || type || ' ' || number");
}

/// For an object, which may be whole or a difference.
std::string lengthOfObject(std::string const& path)
{
    bool const isObject = path.find("/objects/") != std::string::npos && fs::is_regular_file(path);
    return isObject ? ": " + std::to_string(fs::file_size(path)) + " bytes" : "";
}

/// The verified files that have the recorded stamp and another content than the recorded one.
std::string falseRecords(common::RootPath const& root)
{
    std::string names;
    tav::FolderView view(root);
    for (tav::VerifiedFile const& file : tav::LocalDatabase::open(root).verifiedFiles()) {
        bool const isBelieved = view.look(file.path).stamp == file.stamp;
        if (isBelieved && tav::fileDigest(root.pathTo(tav::fromUtf8(file.path))) != file.digest) {
            names += "wrongly believed: " + file.path + "\n";
        }
    }
    return names;
}

} // namespace

bool areOldOrNew(Files const& now, Files const& before, Files const& after)
{
    Files all = before;
    all.insert(after.begin(), after.end());
    all.insert(now.begin(), now.end());
    return std::all_of(all.begin(), all.end(), [&](auto const& file) {
        auto const content = contentIn(now, file.first);
        return content == contentIn(before, file.first) || content == contentIn(after, file.first);
    });
}

Scene::Scene(std::function<void(Scene const&)> const& prepare)
{
    place_.makeFolder("now/repository");
    require(tav({"init", "--server", place_.pathTo("now/server")}).code == 0, "make the repository");
    write(".tav/properties/ignore", place_.read("now/repository/.tav/properties/ignore"));
    write("plan.dwg", drawing(1));
    write("note.txt", "first");
    write("old/gone.dwg", drawing(2));
    require(tav({"add", "--all"}).code == 0, "stage");
    require(tav({"commit", "-m", "first", "--author", "ann@studio"}).code == 0, "commit");
    write("plan.dwg", edited(drawing(1), 1));
    write("note.txt", "second");
    fs::remove_all(folder() + "/old");
    write("new/fresh.dwg", drawing(3));
    require(tav({"add", "--all"}).code == 0, "stage");
    require(tav({"commit", "-m", "second", "--author", "ann@studio", "--all-removed"}).code == 0, "commit");
    prepare(*this);
    copyTree(place_.pathTo("now"), place_.pathTo("first"));
}

void Scene::reset() const
{
    fs::remove_all(place_.pathTo("now"));
    copyTree(place_.pathTo("first"), place_.pathTo("now"));
}

common::RootPath Scene::root() const
{
    return common::RootPath(place_.widePathTo("now/repository"));
}

void Scene::write(std::string const& name, std::string const& content) const
{
    place_.write("now/repository/" + name, content);
    setTimes(folder() + "/" + name, {kLongAgo + ++written_, 0});
}

Outcome Scene::tav(Arguments const& arguments) const
{
    return inCopy([&] { return runHere(arguments); });
}

Outcome Scene::inCopy(std::function<int()> const& body) const
{
    Setting setting;
    setting.folder = folder();
    Process process(setting, [&] {
        doNotWaitForTheDisk();
        SqliteCalls const withSqlite;
        return body();
    });
    return process.wait();
}

Outcome Scene::verifyAndRepeat(SceneRow const& row) const
{
    Arguments const verify = {"verify"};
    Outcome outcome = inCopy([&] {
        int const code = runHere(row.isVerifiedFirst ? verify : row.arguments);
        return code == 0 ? runHere(row.isVerifiedFirst ? row.arguments : verify) : code;
    });
    if (outcome.out.find("Repaired") != std::string::npos) { // Something was damaged all the same.
        outcome.code = 1;
    }
    return outcome;
}

Files Scene::files() const
{
    Files files;
    std::string const prefix = "now/repository/";
    for (std::string const& name : place_.list()) {
        bool const isOfTav = name.rfind(prefix + ".tav/", 0) == 0;
        if (name.rfind(prefix, 0) == 0 && !isOfTav && name.back() != '/') {
            files[name.substr(prefix.size())] = place_.read(name);
        }
    }
    return files;
}

std::string Scene::situation() const
{
    std::string text;
    for (auto const& [path, content] : files()) {
        text += path + ": " + std::to_string(content.size()) + " bytes " +
                std::to_string(std::hash<std::string>()(content)) + "\n";
    }
    // Read before the names are listed: it takes back what was left of an interrupted change.
    tav::Database const server(place_.pathTo("now/server/server.db"));
    tav::Database const local(folder() + "/.tav/tav.db");
    std::string const rows = "\nserver:\n" + commitsIn(server) + "local:\n" + commitsIn(local) +
                             rowsOf(local, "settings", "key || ' ' || value") +
                             rowsOf(local, "contents", "url || ' ' || digest || ' ' || size") + falseRecords(root());
    for (std::string const& name : place_.list()) {
        // What the next command removes or uses again: a probe of the clock, and a journal of SQLite that has ended.
        if (name == "now/repository/.tav/restoring/clock" || name == "now/repository/.tav/tav.db-journal") {
            continue;
        }
        bool const isInside = name.rfind("now/repository/.tav/", 0) == 0 || name.rfind("now/server/", 0) == 0;
        text += isInside ? name + lengthOfObject(place_.pathTo(name)) + "\n" : "";
    }
    return text + withoutTimes(place_.read("now/repository/.tav/tav.state")) + rows;
}

std::string Scene::work() const
{
    std::string text;
    for (auto const& [path, content] : files()) {
        text += path + ": " + content + "\n";
    }
    auto const cache = tav::readState(root());
    text += "on " + cache->read().head.ansi_str() + "\n";
    for (common::StagedFile const& file : cache->read().stagedFiles) {
        text += "staged " + file.path.ansi_str() + " " + std::to_string(static_cast<int>(file.change)) + "\n";
    }
    for (auto const& [path, previous] : cache->read().renames) {
        text += "renamed " + previous.ansi_str() + " " + path.ansi_str() + "\n";
    }
    tav::LocalDatabase const local = tav::LocalDatabase::open(root());
    for (tav::Shelf const& shelf : local.shelves().all()) {
        text += "put aside " + std::to_string(shelf.id) + "\n";
    }
    tav::Database const server(place_.pathTo("now/server/server.db"));
    std::string const refs = "name || ' ' || type || ' ' || number";
    return text + "at " + local.currentCommit().ansi_str() + "\n" + rowsOf(server, "refs", refs) +
           rowsOf(tav::Database(local.path()), "refs", refs);
}

void Scene::forgetOperations() const
{
    tav::Database database(folder() + "/.tav/tav.db");
    for (char const* const table : {"operation_files", "operation_staging", "operation_renames", "operations"}) {
        database.run(("DELETE FROM " + std::string(table)).c_str());
    }
}

std::string difference(std::string const& before, std::string const& after)
{
    std::vector<std::string> const old = linesOf(before);
    std::vector<std::string> const now = linesOf(after);
    std::vector<std::string> gone;
    std::vector<std::string> come;
    std::set_difference(old.begin(), old.end(), now.begin(), now.end(), std::back_inserter(gone));
    std::set_difference(now.begin(), now.end(), old.begin(), old.end(), std::back_inserter(come));
    std::string text;
    for (std::string const& line : gone) {
        text += "- " + line + "\n";
    }
    for (std::string const& line : come) {
        text += "+ " + line + "\n";
    }
    return text;
}

std::string faultOfFailure(Outcome const& outcome)
{
    std::string const& err = outcome.err;
    bool const isOneLine = std::count(err.begin(), err.end(), '\n') == 1 && err.back() == '\n';
    bool const isKnown = err.rfind("tav: ", 0) == 0 && err.find("Internal error") == std::string::npos;
    bool const hasAdvice = err.find(". ") != std::string::npos;
    return outcome.code != 1                      ? "the exit code"
           : !outcome.out.empty()                 ? "a result is printed"
           : !isOneLine || !isKnown || !hasAdvice ? "the message"
                                                  : "";
}

std::string drawing(unsigned seed, std::size_t size)
{
    std::minstd_rand random(seed);
    std::string bytes(size, '\0');
    for (char& byte : bytes) {
        byte = static_cast<char>(random() >> 8);
    }
    return bytes;
}

std::string edited(std::string content, unsigned seed)
{
    std::minstd_rand random(seed);
    for (int i = 0; i < 5; ++i) {
        content[random() % content.size()] = static_cast<char>(random() >> 8);
    }
    return content;
}

namespace {

void changeFiles(Scene const& scene)
{
    scene.write("plan.dwg", edited(drawing(1), 2));
    scene.write("note.txt", "third");
    scene.write("more/added.txt", "added");
    fs::remove_all(scene.folder() + "/new");
    require(scene.tav({"add", "--all"}).code == 0, "stage");
}

void putAside(Scene const& scene)
{
    changeFiles(scene);
    require(scene.tav({"stash"}).code == 0, "put the changes aside");
}

/// What is staged where the two commits agree is carried along.
void stageNewFile(Scene const& scene)
{
    scene.write("carried.txt", "along");
    require(scene.tav({"add", "carried.txt"}).code == 0, "stage");
}

/// What a commit that was interrupted leaves in the storage, and what killed commands leave beside it.
void storeWhatNobodyNeeds(Scene const& scene)
{
    scene.write("plan.dwg", edited(drawing(1), 3));
    scene.write("note.txt", "nobody's");
    {
        tav::LocalDatabase const database = tav::LocalDatabase::open(scene.root());
        tav::Tree const files = database.commits().files(database.currentCommit());
        tav::LocalStorage storage(scene.root(), {[&](OdString const& path) { return files.at(path); }, {}, {}});
        require(storage.store(L"plan.dwg").hasValue(), "store a drawing");
        require(storage.store(L"note.txt").hasValue(), "store a text");
        require(storage.flush().hasValue(), "flush");
    }
    scene.place().write("now/repository/.tav/restoring/0", "left");
    scene.place().write("now/repository/.tav/objects/incoming/left", "left");
    scene.place().write("now/repository/.tav/tf/left.tf.new", "left");
}

/// Somebody else commits on a branch of his own, in a copy of the folder that goes then, and makes a tag.
void commitElsewhere(Scene const& scene)
{
    std::string const other = scene.place().pathTo("now/other");
    copyTree(scene.folder(), other);
    auto const inOther = [&](Arguments arguments) {
        arguments.insert(arguments.begin(), {"-C", other});
        require(scene.tav(arguments).code == 0, "commit elsewhere");
    };
    inOther({"branch", "side", "1"});
    inOther({"switch", "side", "--force"});
    scene.place().write("now/other/note.txt", "theirs");
    inOther({"add", "--all"});
    inOther({"commit", "-m", "theirs", "--author", "bob@studio"});
    inOther({"tag", "seen"});
    fs::remove_all(other);
}

void commitBesideOthers(Scene const& scene)
{
    commitElsewhere(scene);
    changeFiles(scene);
}

/// An older copy of the server is put back, and somebody else gets the number of the commit that it lacks.
void loseACommitOnTheServer(Scene const& scene)
{
    std::string const server = scene.place().read("now/server/server.db");
    std::string const old = scene.place().read("now/repository/.tav/tav.db");
    changeFiles(scene);
    require(scene.tav({"commit", "-m", "third", "--author", "ann@studio", "--all-removed"}).code == 0, "commit");
    std::string const current = scene.place().read("now/repository/.tav/tav.db");
    scene.place().write("now/server/server.db", server);
    scene.place().write("now/repository/.tav/tav.db", old);
    commitElsewhere(scene);
    scene.place().write("now/repository/.tav/tav.db", current);
}

/// What the first version of tav kept in its database.
void bringToTheFirstForm(Scene const& scene)
{
    tav::Database database(scene.folder() + "/.tav/tav.db");
    std::string drops;
    {
        tav::Statement rows = database.prepare(
            "SELECT type || ' ' || name FROM sqlite_master WHERE name NOT LIKE 'sqlite_%' AND name NOT IN "
            "('commits', 'parents', 'changes', 'refs', 'settings', 'contents', 'contents_by_digest') AND tbl_name "
            "NOT IN ('settings', 'contents') ORDER BY type");
        while (rows.next()) {
            drops += "DROP " + rows.text(0).ansi_str() + ";";
        }
    }
    database.run(("PRAGMA foreign_keys = OFF; " + drops + "PRAGMA user_version = 1").c_str());
}

/// Stores a file whole, as earlier versions of tav stored every object.
void storeWhole(Scene const& scene, OdString const& path)
{
    tav::LocalStorage storage(scene.root());
    require(storage.store(path).hasValue(), "store a file");
    require(storage.flush().hasValue(), "flush");
}

/// Three versions of a drawing and its copy, in a store of the first version of tav.
void makeAnOldStore(Scene const& scene)
{
    for (unsigned i = 1; i <= 3; ++i) {
        scene.write("SHEET.DWG", edited(drawing(4, 5000), i));
        storeWhole(scene, L"SHEET.DWG");
        require(scene.tav({"add", "--all"}).code == 0, "stage");
        require(scene.tav({"commit", "-m", "sheet", "--author", "ann@studio"}).code == 0, "commit");
    }
    scene.write("SHEET 2.DWG", edited(drawing(4, 5000), 9));
    storeWhole(scene, L"SHEET 2.DWG");
    require(scene.tav({"add", "--all"}).code == 0, "stage");
    require(scene.tav({"commit", "-m", "copy", "--author", "ann@studio"}).code == 0, "commit");
    bringToTheFirstForm(scene);
}

} // namespace

std::vector<SceneRow> const& historyRows()
{
    static std::vector<SceneRow> const rows = {
        {"Fetch", {"fetch"}, commitElsewhere, false},
        {"CommitBesideOthers",
         {"commit", "-m", "third", "--author", "ann@studio", "--all-removed"},
         commitBesideOthers,
         false},
        {"Switch",
         {"switch", "side"},
         [](Scene const& scene) {
             require(scene.tav({"branch", "side", "1"}).code == 0, "make a branch");
         }},
        {"CheckoutInTheFirstForm", {"checkout", "1"}, bringToTheFirstForm},
        {"Send", {"server", "--send"}, loseACommitOnTheServer, false},
        {"Init",
         {"init", "--server", "../server"},
         [](Scene const& scene) { fs::remove(scene.folder() + "/.tav/tav.db"); },
         false}};
    return rows;
}

std::vector<SceneRow> const& undoRows()
{
    auto const editNote = [](Scene const& scene) { scene.write("note.txt", "third"); };
    static std::vector<SceneRow> const rows = {
        {"Add", {"add", "note.txt"}, editNote},
        {"Unstage", {"unstage", "--all"}, changeFiles},
        {"Rm", {"rm", "plan.dwg", "note.txt"}, [](Scene const&) {}},
        {"Mv", {"mv", "plan.dwg", "план.dwg"}, [](Scene const&) {}},
        {"Restore", {"restore", "plan.dwg", "note.txt", "old/gone.dwg", "--from", "1", "--force"}, editNote},
        {"Checkout", {"checkout", "1"}, stageNewFile},
        {"CheckoutByForce", {"checkout", "1", "--force"}, editNote},
        {"Commit", {"commit", "-m", "third", "--author", "ann@studio", "--all-removed"}, changeFiles},
        {"Amend", {"commit", "--amend", "-m", "more", "--all-removed"}, changeFiles},
        {"Revert", {"revert", "2"}, stageNewFile},
        {"Stash", {"stash", "-m", "more"}, changeFiles},
        {"StashPop", {"stash", "pop"}, putAside},
        {"StashDrop", {"stash", "drop"}, putAside}};
    return rows;
}

bool isDone(Outcome const& outcome)
{
    return outcome.code == 0 && (outcome.err.empty() || outcome.err.rfind("tav: Completed commit ", 0) == 0);
}

std::vector<SceneRow> const& sceneRows()
{
    static std::vector<SceneRow> const rows = {
        {"Commit", {"commit", "-m", "third", "--author", "ann@studio", "--all-removed"}, changeFiles},
        {"Amend", {"commit", "--amend", "-m", "more", "--all-removed"}, changeFiles},
        {"Restore", {"restore", "plan.dwg", "note.txt", "old/gone.dwg", "--from", "1"}, [](Scene const&) {}},
        {"Checkout", {"checkout", "1"}, stageNewFile},
        {"Gc", {"gc"}, storeWhatNobodyNeeds},
        {"GcOfAnOldStore", {"gc"}, makeAnOldStore}};
    return rows;
}

} // namespace host_tests
