// Staging every candidate: the time of one must not grow with their number.
#include "bench/documents.h"
#include "bench/race.h"
#include "common/mu_common_diff.h"

#include <memory>
#include <string>
#include <vector>

namespace {

using bench::check;
using common::RepoFileExplorer;

/// Candidates in memory, and explorers of them that are made anew for each run.
class Staging {
public:
    explicit Staging(int count, int explorers = 1) : explorers_(static_cast<std::size_t>(explorers))
    {
        for (int i = 0; i < count; ++i) {
            OdString const path(bench::drawingPath(i).c_str());
            common::Versions<common::File, void> version;
            version.working.path = path;
            changes_.untracked.push_back(version);
            files_.emplace_back(path, common::FileChange::added);
        }
    }

    bench::Runner runner(std::string const& name)
    {
        return {
            name, [this] { stageAll(); }, [this] { makeExplorers(); },
            static_cast<double>(files_.size() * explorers_.size())};
    }

private:
    void makeExplorers()
    {
        for (std::unique_ptr<RepoFileExplorer>& explorer : explorers_) {
            explorer = std::make_unique<RepoFileExplorer>(changes_, common::RootPath(L"/"));
        }
    }

    void stageAll()
    {
        for (std::unique_ptr<RepoFileExplorer> const& explorer : explorers_) {
            for (common::StagedFile const& file : files_) {
                check(explorer->stage(file), "not staged");
            }
        }
    }

    common::RepoChanges changes_;
    std::vector<common::StagedFile> files_;
    std::vector<std::unique_ptr<RepoFileExplorer>> explorers_;
};

} // namespace

int main(int argc, char** argv)
{
    bench::Table const table(argc, argv);
    for (int const count : table.sizes(200'000)) {
        Staging many(count);
        Staging few(2'000);
        Staging manyTimesFew(2'000, (count + 1'999) / 2'000);
        table.race(
            {"stage, per candidate", bench::grouped(count) + " candidates"}, many.runner("stage"),
            {{few.runner("of 2,000"), 2}, {manyTimesFew.runner("of 2,000, one after another"), std::nullopt}});
    }
}
