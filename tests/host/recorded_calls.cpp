#include "tests/host/recorded_calls.h"

#include "platform/os/os_calls.h"

#include <algorithm>
#include <array>
#include <cstdio>
#include <cstdlib>
#include <fcntl.h>
#include <filesystem>
#include <fstream>
#include <functional>
#include <iterator>
#include <optional>
#include <set>
#include <sys/stat.h>
#include <tuple>
#include <unistd.h>
#include <utility>

namespace host_tests {
namespace {

namespace fs = std::filesystem;

void require(bool succeeded, char const* step, std::string const& path)
{
    if (!succeeded) {
        std::fprintf(stderr, "RecordedCalls: cannot %s '%s'\n", step, path.c_str());
        std::abort();
    }
}

using Identity = std::pair<dev_t, ino_t>;

std::optional<Identity> identityOf(std::string const& path)
{
    struct stat status;
    return lstat(path.c_str(), &status) == 0 ? std::optional(Identity(status.st_dev, status.st_ino)) : std::nullopt;
}

struct Record {
    std::string top;
    os::Calls real{};
    std::map<Identity, int> numbers;
    int nextNumber = 0;
    std::vector<Step> steps;
};

Record record;

std::string linkOf(int file)
{
    std::error_code error;
    return fs::read_symlink("/proc/self/fd/" + std::to_string(file), error).string();
}

std::string fullPath(int folder, std::string const& path)
{
    if (path.front() == '/') {
        return path;
    }
    std::string const start = folder == AT_FDCWD ? fs::current_path().string() : linkOf(folder);
    return path == "." ? start : start + "/" + path;
}

/// Paths elsewhere are nobody's business.
std::optional<std::string> pathBelowTop(std::string const& path)
{
    bool const isBelow = path.rfind(record.top + "/", 0) == 0;
    return isBelow ? std::optional(fs::path(path.substr(record.top.size() + 1)).lexically_normal().string())
                   : std::nullopt;
}

int numberOf(int file)
{
    struct stat status;
    auto const known =
        fstat(file, &status) == 0 ? record.numbers.find({status.st_dev, status.st_ino}) : record.numbers.end();
    return known == record.numbers.end() ? -1 : known->second;
}

void note(Step const& step)
{
    record.steps.push_back(step);
}

void noteOf(int file, Step step)
{
    step.file = numberOf(file);
    if (step.file != -1) {
        note(step);
    }
}

/// Also the number of a file that has gone may come again.
int numberNew(int file)
{
    struct stat status;
    require(fstat(file, &status) == 0, "examine", linkOf(file));
    return record.numbers[{status.st_dev, status.st_ino}] = record.nextNumber++;
}

int openFile(int folder, char const* path, int flags, mode_t mode)
{
    std::string const full = fullPath(folder, path);
    bool const isUnnamed = (flags & O_TMPFILE) == O_TMPFILE;
    bool const isThere = identityOf(full).has_value();
    int const file = record.real.openat(folder, path, flags, mode);
    auto const below = pathBelowTop(full);
    if (file == -1 || !below) {
        return file;
    }
    if (isUnnamed) {
        numberNew(file);
    } else if (!isThere) {
        note({Step::Kind::name, numberNew(file), *below});
    } else if ((flags & O_TRUNC) != 0) {
        noteOf(file, {Step::Kind::truncate});
    }
    return file;
}

ssize_t writeAt(int file, void const* bytes, std::size_t count, off_t offset)
{
    ssize_t const written = record.real.pwrite(file, bytes, count, offset);
    if (written > 0) {
        Step step{Step::Kind::write};
        step.offset = static_cast<std::uint64_t>(offset);
        step.bytes.assign(static_cast<char const*>(bytes), static_cast<std::size_t>(written));
        noteOf(file, std::move(step));
    }
    return written;
}

ssize_t writeNext(int file, void const* bytes, std::size_t count)
{
    off_t const offset = lseek(file, 0, SEEK_CUR);
    ssize_t const written = writeAt(file, bytes, count, offset);
    if (written > 0) {
        lseek(file, offset + written, SEEK_SET);
    }
    return written;
}

int truncate(int file, off_t length)
{
    Step step{Step::Kind::truncate};
    step.offset = static_cast<std::uint64_t>(length);
    noteOf(file, std::move(step));
    return record.real.ftruncate(file, length);
}

int flush(int file)
{
    struct stat status;
    require(fstat(file, &status) == 0, "examine", linkOf(file));
    if (!S_ISDIR(status.st_mode)) {
        noteOf(file, {Step::Kind::flushFile});
    } else if (auto const below = pathBelowTop(linkOf(file))) {
        note({Step::Kind::flushFolder, -1, *below});
    }
    return 0;
}

int flushAll(int /*file*/)
{
    note({Step::Kind::flushAll});
    return 0;
}

int giveName(int fromFolder, char const* from, int toFolder, char const* to, int flags)
{
    int const result = record.real.linkat(fromFolder, from, toFolder, to, flags);
    auto const below = pathBelowTop(fullPath(toFolder, to));
    auto const identity = identityOf(fullPath(toFolder, to));
    if (result == 0 && below && identity) {
        note({Step::Kind::name, record.numbers.at(*identity), *below});
    }
    return result;
}

int rename(int fromFolder, char const* from, int toFolder, char const* to)
{
    int const result = record.real.renameat(fromFolder, from, toFolder, to);
    auto const belowFrom = pathBelowTop(fullPath(fromFolder, from));
    auto const below = pathBelowTop(fullPath(toFolder, to));
    if (result == 0 && belowFrom && below) {
        note({Step::Kind::rename, record.numbers.at(*identityOf(fullPath(toFolder, to))), *below, *belowFrom});
    }
    return result;
}

int removeEntry(int folder, char const* path, int flags)
{
    auto const below = pathBelowTop(fullPath(folder, path));
    int const result = record.real.unlinkat(folder, path, flags);
    if (result == 0 && below) {
        note({Step::Kind::remove, -1, *below});
    }
    return result;
}

int makeFolderIn(int folder, char const* path, mode_t mode)
{
    int const result = record.real.mkdirat(folder, path, mode);
    auto const below = pathBelowTop(fullPath(folder, path));
    if (result == 0 && below) {
        note({Step::Kind::makeFolder, -1, *below});
    }
    return result;
}

int makeFolder(char const* path, mode_t mode)
{
    return makeFolderIn(AT_FDCWD, path, mode);
}

int setTimes(int file, timespec const* times)
{
    Step step{Step::Kind::setTime};
    step.time = times[1];
    noteOf(file, std::move(step));
    return record.real.futimens(file, times);
}

std::string folderOf(std::string const& path)
{
    return path.substr(0, path.rfind('/'));
}

bool isName(Step const& step)
{
    return step.kind == Step::Kind::name || step.kind == Step::Kind::rename || step.kind == Step::Kind::remove ||
           step.kind == Step::Kind::makeFolder;
}

bool isData(Step const& step)
{
    return step.kind == Step::Kind::write || step.kind == Step::Kind::truncate;
}

/// Whether the disk has been waited for since then.
bool flushes(Step const& flush, Step const& step)
{
    switch (flush.kind) {
    case Step::Kind::flushAll: return true;
    case Step::Kind::flushFile: return isData(step) && flush.file == step.file;
    case Step::Kind::flushFolder: return isName(step) && flush.path == folderOf(step.path);
    default: return false;
    }
}

std::set<std::size_t> unflushed(std::vector<Step> const& steps, std::size_t end, bool (*isKind)(Step const&))
{
    std::set<std::size_t> found;
    for (std::size_t i = 0; i < end; ++i) {
        auto const flushesIt = [&](Step const& later) { return flushes(later, steps[i]); };
        auto const from = steps.begin() + static_cast<std::ptrdiff_t>(i);
        if (isKind(steps[i]) && std::none_of(from, steps.begin() + static_cast<std::ptrdiff_t>(end), flushesIt)) {
            found.insert(i);
        }
    }
    return found;
}

/// Makes the file as long as the write does, with nothing in the new part.
Step lengthOnly(Step const& write, Disk const& disk)
{
    Step step{Step::Kind::truncate, write.file};
    auto const file = disk.files.find(write.file);
    std::uint64_t const length = file == disk.files.end() ? 0 : file->second.bytes.size();
    step.offset = std::max<std::uint64_t>(length, write.offset + write.bytes.size());
    return step;
}

enum class Lost { wholly, butTheLength };

Disk diskWithout(
    Disk disk, std::vector<Step> const& steps, std::size_t end, std::set<std::size_t> const& lost, Lost lostData)
{
    for (std::size_t i = 0; i < end; ++i) {
        bool const isLost = lost.count(i) > 0;
        if (!isLost) {
            disk.carryOut(steps[i]);
        } else if (lostData == Lost::butTheLength && steps[i].kind == Step::Kind::write) {
            disk.carryOut(lengthOnly(steps[i], disk));
        }
    }
    return disk;
}

/// The sets of steps that may be lost together: what was not waited for can come to the disk in any order, but trying
/// out all orders would take for ever.
std::vector<std::set<std::size_t>> losses(std::vector<Step> const& steps, std::size_t end)
{
    std::set<std::size_t> const data = unflushed(steps, end, isData);
    std::set<std::size_t> const names = unflushed(steps, end, isName);
    std::set<std::size_t> both = data;
    both.insert(names.begin(), names.end());
    std::vector<std::set<std::size_t>> all = {{}, data, names, both};
    for (std::size_t const name : names) {
        all.push_back({name});
        all.push_back(data);
        all.back().insert(name);
    }
    std::map<int, std::set<std::size_t>> byFile;
    for (std::size_t const step : data) {
        byFile[steps[step].file].insert(step);
    }
    for (auto const& [file, writes] : byFile) {
        all.push_back(writes);
    }
    return all;
}

bool isSame(timespec const& a, timespec const& b)
{
    return a.tv_sec == b.tv_sec && a.tv_nsec == b.tv_nsec;
}

} // namespace

Disk Disk::read(std::string const& top)
{
    Disk disk;
    for (fs::directory_entry const& entry : fs::recursive_directory_iterator(top)) {
        std::string const path = entry.path().string().substr(top.size() + 1);
        if (entry.is_directory()) {
            disk.folders.insert(path);
            continue;
        }
        int const number = static_cast<int>(disk.files.size());
        struct stat status;
        require(lstat(entry.path().c_str(), &status) == 0, "examine", path);
        std::ifstream file(entry.path(), std::ios::binary);
        disk.names[path] = number;
        disk.files[number] = {{std::istreambuf_iterator<char>(file), {}}, status.st_mtim};
    }
    return disk;
}

void Disk::write(std::string const& top) const
{
    require(fs::create_directory(top), "make", top);
    for (std::string const& folder : folders) { // Those above come before those in them.
        require(fs::create_directory(top + "/" + folder), "make", folder);
    }
    for (auto const& [path, number] : names) {
        File const& file = files.at(number);
        std::ofstream(top + "/" + path, std::ios::binary) << file.bytes;
        std::array<timespec, 2> const times = {file.time, file.time};
        require(utimensat(AT_FDCWD, (top + "/" + path).c_str(), times.data(), 0) == 0, "write", path);
    }
}

/// A step whose folder was lost leads nowhere, and a folder stays as long as something is in it.
void Disk::carryOut(Step const& step)
{
    File& file = files[step.file];
    bool const isPlace = folders.count(folderOf(step.path)) > 0;
    switch (step.kind) {
    case Step::Kind::rename: names.erase(step.from); [[fallthrough]];
    case Step::Kind::name:
        if (isPlace) {
            names[step.path] = step.file;
        }
        break;
    case Step::Kind::remove:
        names.erase(step.path);
        if (isEmpty(step.path)) {
            folders.erase(step.path);
        }
        break;
    case Step::Kind::makeFolder:
        if (isPlace) {
            folders.insert(step.path);
        }
        break;
    case Step::Kind::write:
        file.bytes.resize(std::max<std::size_t>(file.bytes.size(), step.offset + step.bytes.size()));
        file.bytes.replace(step.offset, step.bytes.size(), step.bytes);
        file.time = {0, UTIME_NOW};
        break;
    case Step::Kind::truncate: file.bytes.resize(step.offset); break;
    case Step::Kind::setTime: file.time = step.time; break;
    case Step::Kind::flushFile:
    case Step::Kind::flushFolder:
    case Step::Kind::flushAll: break;
    }
}

bool Disk::isEmpty(std::string const& folder) const
{
    std::string const prefix = folder + "/";
    auto const name = names.lower_bound(prefix);
    auto const inner = folders.lower_bound(prefix);
    return (name == names.end() || name->first.rfind(prefix, 0) != 0) &&
           (inner == folders.end() || inner->rfind(prefix, 0) != 0);
}

bool operator==(Disk const& a, Disk const& b)
{
    auto const isSameFile = [&](auto const& x, auto const& y) {
        Disk::File const& first = a.files.at(x.second);
        Disk::File const& second = b.files.at(y.second);
        return x.first == y.first && first.bytes == second.bytes && isSame(first.time, second.time);
    };
    return a.folders == b.folders &&
           std::equal(a.names.begin(), a.names.end(), b.names.begin(), b.names.end(), isSameFile);
}

RecordedCalls::RecordedCalls(std::string const& top, Disk const& start)
{
    record = {top, os::calls(), {}, 0, {}};
    for (auto const& [path, number] : start.names) {
        record.numbers[*identityOf(top + "/" + path)] = number;
        record.nextNumber = std::max(record.nextNumber, number + 1);
    }
    os::Calls& calls = os::calls();
    calls.openat = openFile;
    calls.write = writeNext;
    calls.pwrite = writeAt;
    calls.ftruncate = truncate;
    calls.fsync = flush;
    calls.syncfs = flushAll;
    calls.linkat = giveName;
    calls.renameat = rename;
    calls.unlinkat = removeEntry;
    calls.mkdir = makeFolder;
    calls.mkdirat = makeFolderIn;
    calls.futimens = setTimes;
}

RecordedCalls::~RecordedCalls()
{
    os::calls() = record.real;
}

std::vector<Step> const& RecordedCalls::steps() const
{
    return record.steps;
}

std::vector<Disk> disksAfterCrash(Disk const& start, std::vector<Step> const& steps, std::size_t end)
{
    std::vector<Disk> disks;
    for (std::set<std::size_t> const& lost : losses(steps, end)) {
        for (Lost const lostData : {Lost::wholly, Lost::butTheLength}) {
            Disk disk = diskWithout(start, steps, end, lost, lostData);
            if (std::find(disks.begin(), disks.end(), disk) == disks.end()) {
                disks.push_back(std::move(disk));
            }
        }
    }
    return disks;
}

} // namespace host_tests
