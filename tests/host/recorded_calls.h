/// The writes of a command as a list of steps, and what a crash may leave of them.
#pragma once

#include <cstdint>
#include <ctime>
#include <map>
#include <set>
#include <string>
#include <vector>

namespace host_tests {

/// One call that writes, as far as it concerns what is on the disk. Files have numbers: they change their names.
struct Step {
    enum class Kind {
        name,        ///< gives the file a name: it is new, or was without
        rename,      ///< from `from`
        remove,      ///< the name of a file, or an empty folder
        makeFolder,  //
        write,       //
        truncate,    ///< to `offset`
        setTime,     //
        flushFile,   //
        flushFolder, ///< the names in it
        flushAll
    };
    Kind kind;
    int file = -1;
    std::string path = {}; ///< of the name or folder, in bytes, below the top
    std::string from = {};
    std::uint64_t offset = 0;
    std::string bytes = {};
    timespec time = {};
};

/// A folder in memory.
struct Disk {
    struct File {
        std::string bytes;
        timespec time = {0, UTIME_NOW}; ///< of the last modification
    };
    std::set<std::string> folders;    ///< below the top
    std::map<std::string, int> names; ///< number of the file by path
    std::map<int, File> files;

    static Disk read(std::string const& top);
    /// Makes the folder `top`, which must not exist, hold just this.
    void write(std::string const& top) const;
    void carryOut(Step const& step);
    bool isEmpty(std::string const& folder) const;
};

bool operator==(Disk const& a, Disk const& b);

/// While it lives, notes all steps below the folder `top` that go through `os::calls()`, and flushes nothing. One at a
/// time.
class RecordedCalls {
public:
    /// `start` is what `top` holds.
    RecordedCalls(std::string const& top, Disk const& start);
    RecordedCalls(RecordedCalls const&) = delete;
    RecordedCalls& operator=(RecordedCalls const&) = delete;
    ~RecordedCalls();

    std::vector<Step> const& steps() const;
};

/// What may be on the disk after a crash that comes before the step `end`: everything, or less, as nothing was waited
/// for. Each once.
std::vector<Disk> disksAfterCrash(Disk const& start, std::vector<Step> const& steps, std::size_t end);

} // namespace host_tests
