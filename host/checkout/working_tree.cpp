#include "host/checkout/working_tree.h"

#include "host/changes/digest.h"
#include "host/changes/folder_view.h"
#include "host/changes/index_record.h"
#include "host/changes/stored_copies.h"
#include "host/checkout/file_clock.h"
#include "host/checkout/permissions.h"
#include "host/client/contents.h"
#include "host/errors/failure.h"
#include "host/history/tracked_path.h"
#include "host/terminal/progress.h"
#include "host/text/utf8.h"

#include "platform/os/os_batch.h"
#include "platform/os/os_files.h"

#include <algorithm>
#include <filesystem>
#include <string>

namespace tav {

namespace {

namespace fs = std::filesystem;

constexpr char const* kAgain = "Everything written so far is complete; correct that and run the command again.";
constexpr char const* kNothingYet = "Nothing has been written; correct that and run the command again.";
constexpr std::uint64_t kBetweenFiles = 1000; ///< ns; the finest step that all file systems with fractions know

/// The part of `path` that is there to be looked at: a file may stand where a folder was, or is to be.
OdString partThatStays(OdString const& path, TreeUpdate const& update)
{
    for (std::size_t i = 0; i < path.getLength(); ++i) {
        if (path.getAt(i) != L'/') {
            continue;
        }
        OdString const part = path.left(i);
        if (update.removals.count(part) > 0 || update.writes.count(part) > 0) {
            return part;
        }
    }
    return path;
}

void checkPath(common::RootPath const& root, OdString const& path, TreeUpdate const& update)
{
    if (auto const fault = whyUnsafe(path)) {
        throw Failure(*fault, "Nothing has been written.");
    }
    if (auto const link = linkOnTheWay(root.path().ansi_str(), partThatStays(path, update))) {
        throw Failure(*link, "Nothing has been written; move that away first.");
    }
}

fs::file_type typeOf(OdString const& path, common::RootPath const& root)
{
    std::error_code error;
    return fs::symlink_status(root.pathTo(path).ansi_str(), error).type();
}

enum class Finding { isFree, isAsWanted, holdsUnsaved };

class Check {
public:
    Check(
        common::RootPath const& root, LocalDatabase const& database, std::set<OdString> const& staged, Discard discard,
        TreeUpdate& update)
        : root_(root)
        , database_(database)
        , staged_(staged)
        , discard_(discard)
        , whole_(update)
        , update_(update)
        , batch_(root.path().ansi_str())
    {
    }

    void run()
    {
        sift(update_.removals, false);
        sift(update_.writes, true);
        failIfAnyIsInTheWay();
    }

    /// The files that go, with the URLs of their contents.
    Tree const& replaced() const { return replaced_; }
    /// The files that go with contents that are nowhere else.
    std::vector<OdString> const& discarded() const { return discarded_; }

private:
    /// Takes out of `files` what stays as it is.
    void sift(Tree& files, bool areWritten)
    {
        for (auto file = files.begin(); file != files.end();) {
            auto const& [path, url] = *file;
            checkPath(root_, path, whole_);
            noteMark(path);
            Finding const finding = look(path, areWritten ? &url : nullptr);
            bool const isUnsaved = finding == Finding::holdsUnsaved;
            bool const isLeftover = update_.leftovers.count(path) > 0;
            if (isStagedWork(path, finding) || (isUnsaved && !isLeftover)) {
                inTheWay_.push_back(path.ansi_str());
            }
            if (isUnsaved && !isLeftover) {
                discarded_.push_back(path);
            }
            if (finding == Finding::isAsWanted && areWritten) {
                update_.found.insert(*file);
            }
            bool const stays = finding == Finding::isAsWanted || (isUnsaved && isLeftover);
            file = stays ? files.erase(file) : std::next(file);
        }
    }

    /// Whether the update would drop what somebody has staged: a move to another commit does so whatever the file
    /// holds.
    bool isStagedWork(OdString const& path, Finding finding) const
    {
        bool const isKept = finding == Finding::isAsWanted && discard_ != Discard::nothing;
        return staged_.count(path) > 0 && !isKept;
    }

    /// Before the file is read, so that whatever happens to it from here on shows.
    void noteMark(OdString const& path)
    {
        if (std::error_code const error = batch_.mark(path.ansi_str(), update_.marks[path])) {
            throw Failure("'" + path.ansi_str() + "' cannot be examined: " + error.message() + ".", kNothingYet);
        }
    }

    /// `wanted` is the URL of the content that the file shall have; null when it goes.
    Finding look(OdString const& path, OdString const* wanted)
    {
        fs::file_type const type = typeOf(path, root_);
        if (type == fs::file_type::directory) {
            return wanted ? lookIntoFolder(path) : Finding::isAsWanted;
        }
        if (type == fs::file_type::not_found) {
            if (update_.expected.count(path) > 0) {
                update_.missing.insert(path);
            }
            return wanted ? Finding::isFree : Finding::isAsWanted;
        }
        if (type != fs::file_type::regular) {
            throw Failure(
                "'" + path.ansi_str() + "' is not a regular file.", "Nothing has been written; move it away first.");
        }
        auto const digest = fileDigest(root_.pathTo(path));
        if (!digest) {
            throw Failure(
                "'" + path.ansi_str() + "' cannot be read, so it could not be brought back.",
                "Nothing has been written; make it readable or move it away.");
        }
        OdString url = expectedUrlOf(path, *digest);
        bool const isExpected = !url.isEmpty();
        if (wanted && digest == digestOf(*wanted)) {
            if (!isExpected) {
                update_.others.emplace(path, *wanted);
            }
            return Finding::isAsWanted;
        }
        if (!isExpected && discard_ != Discard::nothing) {
            url = database_.committedUrlOf(*digest);
        }
        if (url.isEmpty()) {
            return Finding::holdsUnsaved;
        }
        if (!isExpected) {
            update_.others.emplace(path, url);
        }
        replaced_.emplace(path, url);
        return Finding::isFree;
    }

    /// The URL of the content of this digest that is expected at `path`; empty when none is.
    OdString expectedUrlOf(OdString const& path, Digest const& digest) const
    {
        auto const [begin, end] = update_.expected.equal_range(path);
        auto const isIt = [&](auto const& file) { return digestOf(file.second) == digest; };
        auto const file = std::find_if(begin, end, isIt);
        return file == end ? OdString() : file->second;
    }

    /// Whether a file can take the place of the folder `path` once the files that go are gone. They have been sifted:
    /// those left out have gone already, or stay.
    Finding lookIntoFolder(OdString const& path) const
    {
        std::string const top = root_.path().ansi_str();
        std::error_code error;
        fs::recursive_directory_iterator entry(top + "/" + path.ansi_str(), error);
        for (; !error && entry != fs::recursive_directory_iterator(); entry.increment(error)) {
            std::string const name = entry->path().string().substr(top.size() + 1);
            bool const isFolder = entry->symlink_status(error).type() == fs::file_type::directory;
            if (!isFolder && update_.removals.count(fromUtf8(name)) == 0) {
                throw Failure(
                    "'" + name + "' is in a folder that a file of the commit replaces.",
                    "Nothing has been written; move it away first.");
            }
        }
        if (error) {
            throw Failure("The folder '" + path.ansi_str() + "' cannot be read: " + error.message() + ".", kNothingYet);
        }
        return Finding::isFree;
    }

    void failIfAnyIsInTheWay()
    {
        if (inTheWay_.empty() || discard_ == Discard::everything) {
            return;
        }
        Failure failure(
            "These files have uncommitted changes, which would be lost.",
            "Commit them first, or discard them with --force:");
        failure.details = std::move(inTheWay_);
        throw failure;
    }

    common::RootPath const& root_;
    LocalDatabase const& database_;
    std::set<OdString> const& staged_;
    Discard discard_;
    TreeUpdate const whole_; ///< as it was at first
    TreeUpdate& update_;
    os::Batch batch_;
    Tree replaced_;
    std::vector<OdString> discarded_;
    std::vector<std::string> inTheWay_;
};

/// Keeps contents that nobody has committed.
void storeDiscarded(LocalStorage& storage, std::vector<OdString> const& paths, TreeUpdate& update)
{
    std::vector<OdString> urls;
    for (OdString const& path : paths) {
        urls.push_back(valueOrFail(storage.store(path), kNothingYet));
        update.others[path] = urls.back();
    }
    valueOrFail(storage.flush(), kNothingYet);
    for (OdString const& url : urls) {
        valueOrFail(storage.verify(url), "Nothing has been written; the disk may be failing.");
    }
}

OdString const kRestoring = L".tav/restoring";

/// Files on their way to their names.
class Restored {
public:
    explicit Restored(common::RootPath const& root) : folder_(root.pathTo(kRestoring).ansi_str())
    {
        if (std::error_code const error = os::makeFolders(folder_, 0777)) {
            throw Failure("'" + folder_ + "' cannot be made: " + error.message() + ".", kNothingYet);
        }
        removeAll(); // A command that was killed may have left some.
    }
    Restored(Restored const&) = delete;
    Restored& operator=(Restored const&) = delete;
    ~Restored()
    {
        try {
            removeAll();
        } catch (...) {
            // There is no memory; the next command removes what is left.
        }
    }

    std::string pathOf(std::size_t number) const { return folder_ + "/" + std::to_string(number); }

    std::string scratch() const { return folder_ + "/clock"; }

private:
    void removeAll() const
    {
        os::Batch batch(folder_);
        os::FolderReader const reader = os::openFolder(folder_);
        while (dirent const* const entry = reader ? readdir(reader.get()) : nullptr) {
            [[maybe_unused]] std::error_code const ignored = batch.remove(entry->d_name); // Folders stay.
        }
    }

    std::string folder_;
};

void requireDone(std::error_code const& error, OdString const& path, char const* next)
{
    if (error) {
        throw Failure("'" + path.ansi_str() + "' cannot be written: " + error.message() + ".", next);
    }
}

/// What the files have that were written, under whatever name.
using Stamps = std::map<OdString, FileStamp>;

Stamps extractAll(
    common::RootPath const& root, LocalStorage& storage, TreeUpdate const& update, std::uint64_t time,
    Restored const& restored)
{
    Tree const& files = update.writes;
    Stamps stamps;
    FolderView view(root);
    Progress progress("files", files.size());
    std::size_t number = 0;
    for (auto const& file : files) {
        std::string const target = restored.pathOf(number);
        extract(storage, file, target);
        requireDone(os::setModificationTime(target, time - number * kBetweenFiles), file.first, kNothingYet);
        if (auto const own = update.permissions.find(file.first); own != update.permissions.end()) {
            setPermissions(target, own->second);
        }
        Sight const sight = view.look(kRestoring + L"/" + std::to_wstring(number).c_str());
        stamps.emplace(file.first, sight.stamp.value_or(FileStamp{}));
        ++number;
        progress.advance();
    }
    return stamps;
}

/// People go on working while a command runs.
void requireUnchanged(os::Batch& batch, TreeUpdate const& update, OdString const& path, char const* next)
{
    os::FileMark now;
    requireDone(batch.mark(path.ansi_str(), now), path, next);
    if (!isSame(now, update.marks.at(path))) {
        throw Failure("'" + path.ansi_str() + "' changed while this command was running.", next);
    }
}

void requireAllUnchanged(os::Batch& batch, TreeUpdate const& update)
{
    for (Tree const* const files : {&update.removals, &update.writes}) {
        for (auto const& [path, url] : *files) {
            requireUnchanged(batch, update, path, "Nothing has been written; run the command again.");
        }
    }
}

void placeAll(
    os::Batch& batch, TreeUpdate const& update, Restored const& restored, std::function<void()> const& changed)
{
    constexpr char const* kWhole = "Everything written so far is complete; run the command again.";
    for (auto const& [path, url] : update.removals) {
        requireUnchanged(batch, update, path, kWhole);
        requireDone(batch.remove(path.ansi_str()), path, kAgain);
        changed();
        batch.removeEmptyFoldersOf(path.ansi_str());
    }
    std::size_t number = 0;
    for (auto const& [path, url] : update.writes) {
        requireUnchanged(batch, update, path, kWhole);
        requireDone(batch.place(restored.pathOf(number++), path.ansi_str()), path, kAgain);
        changed();
    }
}

/// Whether a file is the one that was written. Taking its name was a change too.
bool isWritten(FileStamp const& now, FileStamp const& written)
{
    return now.inode == written.inode && now.size == written.size && now.modified == written.modified;
}

/// Whether nothing has happened to a file since it was checked.
bool isAsChecked(FileStamp const& now, os::FileMark const& mark)
{
    return now == FileStamp{mark.length, mark.number, mark.changed, mark.modified};
}

/// Records of the files that are as wanted, after what was written has become older than the clock.
VerifiedFileList
verifiedFiles(common::RootPath const& root, TreeUpdate const& update, Stamps const& written, Restored const& restored)
{
    std::uint64_t const now = waitForNextTick(restored.scratch());
    FolderView view(root);
    VerifiedFileList verified;
    for (Tree const* const files : {&update.writes, &update.found}) {
        for (auto const& [path, url] : *files) {
            auto const stamp = view.look(path).stamp;
            auto const own = written.find(path);
            bool const isWanted = stamp && (own != written.end() ? isWritten(*stamp, own->second)
                                                                 : isAsChecked(*stamp, update.marks.at(path)));
            if (isWanted) {
                verified.push_back({path.ansi_str(), *digestOf(url), *stamp});
            }
        }
    }
    return settledFiles(std::move(verified), now);
}

/// Adds to `update` what is in the way of `to` only where files of `begun` have been written.
void addLeftovers(Tree const& begun, Tree const& to, TreeUpdate& update)
{
    TreeUpdate more = updateBetween(begun, {}, to);
    for (Tree* const files : {&more.writes, &more.removals}) {
        Tree& known = files == &more.writes ? update.writes : update.removals;
        for (auto const& file : *files) {
            if (known.insert(file).second) {
                update.leftovers.insert(file.first);
            }
        }
    }
}

/// What the files of `commit` have at the paths of `update`.
void addExpected(Tree const& commit, TreeUpdate& update)
{
    for (Tree const* const files : {&update.writes, &update.removals}) {
        for (auto const& [path, url] : *files) {
            auto const file = commit.find(path);
            if (file != commit.end()) {
                update.expected.insert(*file);
            }
        }
    }
}

} // namespace

void extract(LocalStorage& storage, Tree::value_type const& file, std::string const& target)
{
    auto const& [path, url] = file;
    if (auto const done = storage.extract(url, target); !done.hasValue()) {
        bool const isDamaged = !storage.verify(url).hasValue();
        throw Failure(
            "'" + path.ansi_str() + "' cannot be restored: " + done.error().message.ansi_str(),
            isDamaged ? "Run 'tav verify' to see what is damaged." : "Check the free space.");
    }
}

TreeUpdate updateBetween(Tree const& from, std::vector<Tree> const& begun, Tree const& to)
{
    TreeUpdate update;
    for (auto const& [path, url] : to) {
        auto const before = from.find(path);
        if (before == from.end() || before->second != url) {
            update.writes.emplace(path, url);
        }
    }
    for (auto const& [path, url] : from) {
        if (to.count(path) == 0) {
            update.removals.emplace(path, url);
        }
    }
    for (Tree const& files : begun) {
        addLeftovers(files, to, update);
    }
    addExpected(from, update);
    for (Tree const& files : begun) {
        addExpected(files, update);
    }
    return update;
}

void checkUpdate(
    common::RootPath const& root, LocalDatabase const& database, LocalStorage& storage,
    std::set<OdString> const& staged, Discard discard, TreeUpdate& update)
{
    Check check(root, database, staged, discard, update);
    check.run();
    requireHere(update.writes, database, storage);
    Progress progress("stored versions", check.replaced().size());
    for (auto const& [path, url] : check.replaced()) {
        requireStored(storage, path, url);
        progress.advance();
    }
    if (!check.discarded().empty()) {
        storeDiscarded(storage, check.discarded(), update);
    }
}

std::vector<OdString> planUpdate(
    common::RootPath const& root, LocalDatabase const& database, LocalStorage& storage,
    std::set<OdString> const& staged, Discard discard, TreeUpdate& update)
{
    Check check(root, database, staged, discard, update);
    check.run();
    requireHere(update.writes, database, storage);
    return check.discarded();
}

/// The files whose unexpected contents go, with these in place of what was expected.
std::vector<FileContents> discardedFiles(TreeUpdate const& update, Side to)
{
    std::vector<FileContents> files;
    for (Tree const* const tree : {&update.writes, &update.removals}) {
        for (auto const& [path, wanted] : *tree) {
            auto const other = update.others.find(path);
            if (other != update.others.end()) {
                files.push_back(
                    to == Side::before ? FileContents{path, wanted, other->second}
                                       : FileContents{path, other->second, wanted});
            }
        }
    }
    return files;
}

void addPermissions(std::vector<FileContents> const& files, TreeUpdate& update)
{
    for (FileContents const& file : files) {
        if (file.permissions != 0) {
            update.permissions.emplace(file.path, file.permissions);
        }
    }
}

std::vector<OdString> pathsOf(std::vector<FileContents> const& files)
{
    std::vector<OdString> paths;
    for (FileContents const& file : files) {
        paths.push_back(file.path);
    }
    return paths;
}

Updated carryOut(
    common::RootPath const& root, LocalStorage& storage, TreeUpdate const& update, std::uint64_t start,
    std::function<void()> const& begin, std::function<void()> const& changed)
{
    os::Batch batch(root.path().ansi_str());
    Restored const restored(root);
    Stamps const stamps = extractAll(root, storage, update, timeForWrittenFiles(start), restored);
    requireDone(batch.flush(), kRestoring, kNothingYet);
    requireAllUnchanged(batch, update);
    begin();
    placeAll(batch, update, restored, changed);
    changed();
    requireDone(batch.flush(), root.path(), kAgain);
    Updated updated;
    for (auto const& [path, stamp] : stamps) {
        updated.times.emplace(path, static_cast<std::uint64_t>(stamp.modified));
    }
    updated.verified = verifiedFiles(root, update, stamps, restored);
    return updated;
}

} // namespace tav
