#include "bench/race.h"

#include <algorithm>
#include <cstdio>
#include <limits>
#include <map>
#include <vector>

#include <benchmark/benchmark.h>

namespace bench {

namespace {

/// Prints nothing; remembers the best time of each runner, in seconds.
class BestTimes : public benchmark::BenchmarkReporter {
public:
    bool ReportContext(Context const&) override { return true; }

    void ReportRuns(std::vector<Run> const& runs) override
    {
        for (Run const& run : runs) {
            if (run.run_type == Run::RT_Iteration) {
                double& best = times_.try_emplace(run.run_name.function_name, kNever).first->second;
                best = std::min(best, run.real_accumulated_time / static_cast<double>(run.iterations));
            }
        }
    }

    bool has(std::string const& name) const { return times_.count(name) > 0; }
    double of(std::string const& name) const { return times_.at(name); }

private:
    static constexpr double kNever = std::numeric_limits<double>::infinity();

    std::map<std::string, double> times_;
};

void addRunner(std::string const& name, std::function<void()> const& run)
{
    auto const loop = [run](benchmark::State& state) {
        for ([[maybe_unused]] auto const round : state) {
            run();
        }
    };
    benchmark::RegisterBenchmark(name.c_str(), loop)->UseRealTime();
}

/// Alternating repetitions, the best of five; arguments of the program come later and so win.
void initialize(int argc, char** argv)
{
    std::string defaults[] = {
        "--benchmark_enable_random_interleaving=true", "--benchmark_repetitions=5", "--benchmark_min_time=0.2"};
    std::vector<char*> arguments = {argv[0]};
    for (std::string& argument : defaults) {
        arguments.push_back(argument.data());
    }
    arguments.insert(arguments.end(), argv + 1, argv + argc);
    int count = static_cast<int>(arguments.size());
    benchmark::Initialize(&count, arguments.data());
}

} // namespace

void Race::ours(std::string const& name, std::function<void()> const& run)
{
    ours_ = name;
    addRunner(name, run);
}

void Race::peer(std::string const& name, std::function<void()> const& run)
{
    peer_ = name;
    addRunner(name, run);
}

int Race::run(int argc, char** argv) const
{
    initialize(argc, argv);
    BestTimes best;
    benchmark::RunSpecifiedBenchmarks(&best);
    if (!best.has(ours_) || !best.has(peer_)) {
        std::fprintf(stderr, "a race takes both runners\n");
        return 1;
    }
    std::printf("%s\n", name_.c_str());
    std::printf("  ours  %-32s %10.3f ms\n", ours_.c_str(), best.of(ours_) * 1e3);
    std::printf("  peer  %-32s %10.3f ms\n", peer_.c_str(), best.of(peer_) * 1e3);
    std::printf("  ours / peer %26s %10.2f\n", "", best.of(ours_) / best.of(peer_));
    return 0;
}

} // namespace bench
