// The working state of a large repository beside the index that git keeps of as many files.
#include "bench/documents.h"
#include "bench/race.h"
#include "bench/scratch.h"
#include "common/mu_common_io_utils.h"
#include "common/mu_common_state.h"
#include "json/json_writer.h"

#include <clocale>
#include <cstdint>
#include <filesystem>
#include <fstream>
#include <memory>
#include <string>

namespace {

using bench::check;
using bench::git;
using bench::Scratch;
using bench::Table;
using common::Cache;
using common::RootPath;

class Io final : public common::IoInterface {
public:
    std::int32_t accept(OdString const& /*path*/) const override { return 1; }
    void report(WriteOutcome const& outcome) const override { check(outcome.hasValue(), "the state is not saved"); }
};

Io const io;

std::string narrow(std::wstring const& text)
{
    return OdString(text.c_str(), text.size()).ansi_str();
}

std::shared_ptr<Cache> load(RootPath const& root)
{
    return Cache::get(root, io).value();
}

void makeState(std::string const& folder, int records)
{
    bench::writeFile(
        folder + "/.tav/tav.state", narrow(kutils::json::write_string(bench::stateDocument(records), true)));
}

void makeIndex(std::string const& folder, int records)
{
    bench::writeFile(folder + "/info", "");
    std::ofstream info(folder + "/info");
    for (int i = 0; i < records; ++i) {
        info << "100644 e69de29bb2d1d6434b8b29ae775ad8c2e48c5391\t" << narrow(bench::drawingPath(i)) << '\n';
    }
    info.close();
    bench::runCommand(git(folder, {"init", "-q"}));
    bench::runCommand(git(folder, {"update-index", "--index-info"}), folder + "/info");
}

void get(Table const& table, std::string const& data, RootPath const& root, std::string const& gitFolder)
{
    table.race(
        {"Cache::get and release", data}, {"Cache::get", [&] { load(root); }},
        {{{"git ls-files --stage",
           [&] {
               bench::runCommand(git(gitFolder, {"ls-files", "--stage"}));
           }},
          4}});
}

/// Our file is flushed to the disk before it takes its place; git is told to do so too.
void save(Table const& table, std::string const& data, RootPath const& root, std::string const& gitFolder)
{
    std::string const drawing = narrow(bench::drawingPath(1));
    std::shared_ptr<Cache> cache;
    std::uint64_t changes = 0;
    table.race(
        {"Cache save after one change", data},
        {"Cache", [&] { cache.reset(); },
         [&] {
             cache = load(root);
             cache->write().index.begin()->second.lastChecked = ++changes;
         }},
        {{{"git update-index FILE",
           [&] {
               bench::runCommand(git(gitFolder, {"-c", "core.fsync=index", "update-index", drawing}));
           },
           [&] { bench::writeFile(gitFolder + "/" + drawing, std::to_string(++changes)); }},
          3}});
}

/// What the child says on its standard output: the most memory that it ever had, in kB.
double peakOfGet(std::string const& folder)
{
    std::string const out = folder + "/peak";
    std::string const self = std::filesystem::read_symlink("/proc/self/exe").string();
    bench::runCommand({self, "--peak-of-get", folder, out});
    double peak = 0;
    std::ifstream(out) >> peak;
    return peak;
}

void memory(std::string const& data, std::string const& folder)
{
    double const peak = peakOfGet(folder) / 1000;
    double const file = static_cast<double>(std::filesystem::file_size(folder + "/.tav/tav.state")) / 1e6;
    auto const megabytes = [](double number) { return std::to_string(static_cast<long>(number)) + " MB"; };
    bench::printRow(
        {"memory of Cache::get", data}, megabytes(peak), "the state file", megabytes(file), 12, peak / file);
}

void raceAll(Table const& table, int records)
{
    Scratch const scratch;
    std::string const ours = scratch.pathTo("ours");
    std::string const peer = scratch.pathTo("peer");
    std::string const data = bench::grouped(records) + " index records";
    makeState(ours, records);
    makeIndex(peer, records);
    RootPath const root(OdString(ours.c_str(), CP_UTF_8));
    get(table, data, root, peer);
    if (!table.scaling()) {
        save(table, data, root, peer);
        memory(data, ours);
    }
}

int writePeak(std::string const& folder, std::string const& out)
{
    load(RootPath(OdString(folder.c_str(), CP_UTF_8)));
    std::ifstream status("/proc/self/status");
    for (std::string word; status >> word;) {
        if (word == "VmHWM:") {
            double peak = 0;
            status >> peak;
            std::ofstream(out) << peak * 1.024;
            return 0;
        }
    }
    return 1;
}

} // namespace

int main(int argc, char** argv)
{
    std::setlocale(LC_ALL, "C.UTF-8");
    if (argc == 4 && std::string(argv[1]) == "--peak-of-get") {
        return writePeak(argv[2], argv[3]);
    }
    Table const table(argc, argv);
    for (int const records : table.sizes(200'000)) {
        raceAll(table, records);
    }
}
