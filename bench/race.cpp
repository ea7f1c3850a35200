#include "bench/race.h"

#include <algorithm>
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <limits>
#include <map>
#include <string_view>

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

    double of(Runner const& runner) const { return times_.at(runner.name) / runner.pieces; }

private:
    static constexpr double kNever = std::numeric_limits<double>::infinity();

    std::map<std::string, double> times_;
};

void addRunner(Runner const& runner)
{
    auto const loop = [&runner](benchmark::State& state) {
        using Clock = std::chrono::steady_clock;
        for ([[maybe_unused]] auto const round : state) {
            if (runner.before) {
                runner.before();
            }
            Clock::time_point const start = Clock::now();
            runner.run();
            state.SetIterationTime(std::chrono::duration<double>(Clock::now() - start).count());
        }
    };
    benchmark::RegisterBenchmark(runner.name.c_str(), loop)->UseManualTime();
}

/// Alternating repetitions, the best of five or a quick one; arguments of the program come later and so win.
void initialize(std::vector<char*> const& given, bool quick)
{
    std::string defaults[] = {
        "--benchmark_enable_random_interleaving=true", "--benchmark_repetitions=" + std::string(quick ? "1" : "5"),
        "--benchmark_min_time=" + std::string(quick ? "0.01" : "0.2")};
    std::vector<char*> arguments = {given.front()};
    for (std::string& argument : defaults) {
        arguments.push_back(argument.data());
    }
    arguments.insert(arguments.end(), given.begin() + 1, given.end());
    int count = static_cast<int>(arguments.size());
    benchmark::Initialize(&count, arguments.data());
}

std::string printed(char const* format, double number)
{
    char text[64];
    std::snprintf(text, sizeof text, format, number);
    return text;
}

std::string timeText(double seconds)
{
    return seconds < 1e-5 ? printed("%.1f ns", seconds * 1e9) : printed("%.2f ms", seconds * 1e3);
}

} // namespace

Table::Table(int argc, char** argv)
{
    std::vector<char*> others;
    for (int i = 0; i < argc; ++i) {
        std::string_view const argument = argv[i];
        quick_ = quick_ || argument == "--quick";
        scaling_ = scaling_ || argument == "--scaling";
        if (argument != "--quick" && argument != "--scaling") {
            others.push_back(argv[i]);
        }
    }
    initialize(others, quick_);
    std::setvbuf(stdout, nullptr, _IOLBF, 0);
}

std::vector<int> Table::sizes(int usual) const
{
    if (scaling_) {
        return quick_ ? std::vector<int>{1'000, 10'000} : std::vector<int>{1'000, 10'000, 100'000, 1'000'000};
    }
    return {quick_ ? usual / 100 : usual};
}

void Table::race(Work const& work, Runner const& ours, std::vector<Peer> const& peers) const
{
    addRunner(ours);
    for (Peer const& peer : peers) {
        addRunner(peer.runner);
    }
    BestTimes best;
    benchmark::RunSpecifiedBenchmarks(&best);
    benchmark::ClearRegisteredBenchmarks();
    for (Peer const& peer : peers) {
        double const time = best.of(ours);
        double const theirs = best.of(peer.runner);
        printRow(work, timeText(time), peer.runner.name, timeText(theirs), peer.target, time / theirs);
    }
}

void printRow(
    Work const& work, std::string const& ours, std::string const& peerName, std::string const& peer,
    std::optional<double> target, double ratio)
{
    std::printf(
        "%-28s %-34s %12s  %-30s %12s %7s %6.2f\n", work.what.c_str(), work.data.c_str(), ours.c_str(),
        peerName.c_str(), peer.c_str(), target ? printed("%.2f", *target).c_str() : "-", ratio);
}

std::string grouped(long number)
{
    std::string text = std::to_string(number);
    for (std::size_t at = text.size(); at > 3;) {
        at -= 3;
        text.insert(at, ",");
    }
    return text;
}

void check(bool holds, char const* what)
{
    if (!holds) {
        std::fprintf(stderr, "the benchmark is wrong: %s\n", what);
        std::abort();
    }
}

} // namespace bench
