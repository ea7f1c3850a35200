/// A race between our code and a peer, on Google Benchmark.
#pragma once

#include <functional>
#include <string>
#include <utility>

namespace bench {

/// Two runners, alternating over several rounds, so that a slow spell of the machine meets both.
/// One race per program; what the runners refer to must outlive it.
class Race {
public:
    /// `name` says what is done and how much of it.
    explicit Race(std::string name) : name_(std::move(name)) {}

    void ours(std::string const& name, std::function<void()> const& run);
    void peer(std::string const& name, std::function<void()> const& run);

    /// Runs both and prints the best time of each, and ours / peer: below 1 ours is the faster one.
    /// Takes Google Benchmark's own arguments (`--benchmark_repetitions=20`). Returns what `main` is to return.
    int run(int argc, char** argv) const;

private:
    std::string name_;
    std::string ours_;
    std::string peer_;
};

} // namespace bench
