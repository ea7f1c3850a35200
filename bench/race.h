/// Races between our code and a peer, on Google Benchmark.
#pragma once

#include <functional>
#include <optional>
#include <string>
#include <vector>

namespace bench {

/// One way to do the work of a race.
struct Runner {
    std::string name;
    std::function<void()> run;         ///< what is timed
    std::function<void()> before = {}; ///< comes before each run and is not timed; what a run leaves is cleared here
    double pieces = 1;                 ///< how many pieces of work a run does; what is compared is the time of one
};

/// Somebody else's way, and how our time over theirs is meant to come out at most.
struct Peer {
    Runner runner;
    std::optional<double> target;
};

/// What is done, and with what.
struct Work {
    std::string what;
    std::string data;
};

/// The races of a program. Each prints a row for each peer: what, with what, our best time, the peer's name and best
/// time, the target, and our time over the peer's: below 1 ours is the faster one.
class Table {
public:
    /// Takes Google Benchmark's own arguments (`--benchmark_repetitions=20`), and one of
    /// --quick     a hundredth of the data, to see that everything runs
    /// --scaling   only the rows whose time is to be seen over sizes from 1,000 to 1,000,000
    Table(int argc, char** argv);

    bool scaling() const { return scaling_; }
    /// The sizes to run a row with that usually has `usual` things.
    std::vector<int> sizes(int usual) const;

    /// All runners, alternating over several rounds, so that a slow spell of the machine meets each of them.
    void race(Work const& work, Runner const& ours, std::vector<Peer> const& peers) const;

private:
    bool quick_ = false;
    bool scaling_ = false;
};

/// Prints one row; numbers come with their unit.
void printRow(
    Work const& work, std::string const& ours, std::string const& peerName, std::string const& peer,
    std::optional<double> target, double ratio);

/// 1234567 as "1,234,567".
std::string grouped(long number);

/// Stops the program when what was raced did something else than it was meant to.
void check(bool holds, char const* what);

} // namespace bench
