#include "host/history/file_history.h"

#include "host/repository/local_database.h"
#include "host/text/utf8.h"

#include "tests/support/temp_repository.h"

#include <gmock/gmock.h>

#include <string>
#include <vector>

namespace {

using testing::ElementsAre;
using testing::IsEmpty;

/// A history that branches and is merged:
///
///     1 --- 2 --- 4 --- 5
///      `--- 3 ---------'
class FileHistory : public testing::Test {
protected:
    void add(std::int64_t number, std::vector<std::int64_t> const& parents, std::vector<tav::FileRecord> const& changes)
    {
        std::vector<OdString> hashes;
        for (std::int64_t const parent : parents) {
            hashes.push_back(hashOf(parent));
        }
        database_.commits().addChanges({number, hashOf(number), L"ann", L"drawn", 0, hashes}, changes);
    }

    /// "5 modified a.dwg" for each event.
    std::vector<std::string> history(std::vector<std::int64_t> const& starts, char const* path) const
    {
        std::vector<std::string> events;
        for (auto const& entry : tav::fileHistory(database_.commits(), starts, {tav::fromUtf8(path)})) {
            for (tav::FileEvent const& event : entry.events) {
                std::string const from = event.previousPath.isEmpty() ? "" : " from " + event.previousPath.ansi_str();
                events.push_back(
                    std::to_string(entry.commit) + " " + common::toString(event.change).value().ansi_str() + " " +
                    event.path.ansi_str() + from);
            }
        }
        return events;
    }

private:
    static OdString hashOf(std::int64_t number) { return OdString().format(L"%064d", static_cast<int>(number)); }

    support::TempRepository const repo_;
    tav::LocalDatabase database_ = tav::LocalDatabase::make(repo_.root());
};

TEST_F(FileHistory, FollowsAFileToTheSideThatAMergeTookItFrom)
{
    add(1, {}, {{L"a.dwg", L"po:1", L""}});
    add(2, {1}, {{L"other.dwg", L"po:2", L""}});
    add(3, {1}, {{L"a.dwg", L"po:3", L""}});
    add(4, {2}, {{L"other.dwg", L"po:4", L""}});
    add(5, {4, 3}, {{L"a.dwg", L"po:3", L""}});
    EXPECT_THAT(history({5}, "a.dwg"), ElementsAre("3 modified a.dwg", "1 added a.dwg"));
    EXPECT_THAT(history({4}, "a.dwg"), ElementsAre("1 added a.dwg"));
}

TEST_F(FileHistory, ListsAMergeThatChangedTheFileItself)
{
    add(1, {}, {{L"a.dwg", L"po:1", L""}});
    add(2, {1}, {{L"a.dwg", L"po:2", L""}});
    add(3, {1}, {{L"a.dwg", L"po:3", L""}});
    add(4, {2, 3}, {{L"a.dwg", L"po:4", L""}});
    EXPECT_THAT(
        history({4}, "a.dwg"),
        ElementsAre("4 modified a.dwg", "3 modified a.dwg", "2 modified a.dwg", "1 added a.dwg"));
}

TEST_F(FileHistory, LeavesOutTheSideThatAMergeTookNothingOf)
{
    add(1, {}, {{L"a.dwg", L"po:1", L""}});
    add(2, {1}, {{L"a.dwg", L"po:2", L""}});
    add(3, {1}, {{L"a.dwg", L"po:3", L""}});
    add(4, {2, 3}, {});
    EXPECT_THAT(history({4}, "a.dwg"), ElementsAre("2 modified a.dwg", "1 added a.dwg"));
}

TEST_F(FileHistory, FollowsFilesThatChangePlaces)
{
    add(1, {}, {{L"a.dwg", L"po:1", L""}, {L"b.dwg", L"po:2", L""}});
    add(2, {1}, {{L"a.dwg", L"po:2", L"b.dwg"}, {L"b.dwg", L"po:1", L"a.dwg"}});
    EXPECT_THAT(history({2}, "a.dwg"), ElementsAre("2 modified a.dwg from b.dwg", "1 added b.dwg"));
}

TEST_F(FileHistory, FollowsEachBranchThatItBeginsAt)
{
    add(1, {}, {{L"a.dwg", L"po:1", L""}});
    add(2, {1}, {{L"a.dwg", L"", L""}});
    add(3, {1}, {{L"a.dwg", L"", L""}, {L"図面/b.dwg", L"po:1", L"a.dwg"}});
    EXPECT_THAT(history({2}, "a.dwg"), ElementsAre("2 removed a.dwg", "1 added a.dwg"));
    EXPECT_THAT(history({2, 3}, "図面"), ElementsAre("3 added 図面/b.dwg from a.dwg", "1 added a.dwg"));
    EXPECT_THAT(
        history({2, 3}, "a.dwg"), ElementsAre("3 added 図面/b.dwg from a.dwg", "2 removed a.dwg", "1 added a.dwg"));
}

TEST_F(FileHistory, TakesAFolderForNoOtherWhoseNameBeginsSo)
{
    add(1, {}, {{L"plans/a.dwg", L"po:1", L""}, {L"plans 2/b.dwg", L"po:2", L""}, {L"plans", L"po:3", L""}});
    add(2, {1}, {{L"plans 2/b.dwg", L"po:4", L""}});
    EXPECT_THAT(history({2}, "plans"), ElementsAre("1 added plans", "1 added plans/a.dwg"));
    EXPECT_THAT(history({2}, "plan"), IsEmpty());
}

} // namespace
