#include "host/commits/commit_names.h"

#include "host/errors/failure.h"
#include "host/text/utf8.h"

#include "tests/support/rows.h"
#include "tests/support/temp_repository.h"

#include <gtest/gtest.h>

#include <initializer_list>
#include <string>
#include <vector>

namespace {

struct Row {
    char const* name;
    char const* typed;
    char const* found; ///< the number of the commit, "none", or what is wrong
};

/// Commits on a branch "master", with a side branch that commit 5 merges; the folder stands on 5:
///
///     1 --- 2 --- 4 --- 5
///      `--- 3 ---------'
class CommitNames : public testing::TestWithParam<Row> {
protected:
    CommitNames()
    {
        add(1, "abcd1", {});
        add(2, "abcd2", {"abcd1"});
        add(3, "cafe3", {"abcd1"});
        add(4, "12345", {"abcd2"});
        add(5, "fade5", {"12345", "cafe3"});
        database_.setCurrentCommit(L"fade5");
        name("master", "fade5");
        name("черновик", "cafe3");
        name("設計", "abcd2");
        name("old~1", "abcd1");
        name("4711", "abcd2");
    }

    std::string found(std::string const& typed) const
    {
        try {
            auto const commit = tav::findCommitIfAny(database_, typed);
            return commit ? std::to_string(commit->number) : "none";
        } catch (tav::Failure const& failure) {
            return failure.what;
        }
    }

private:
    void add(std::int64_t number, char const* hash, std::initializer_list<char const*> names)
    {
        std::vector<OdString> parents;
        for (char const* const parent : names) {
            parents.push_back(tav::fromUtf8(parent));
        }
        // A commit a day, from 2024-03-01 on.
        std::int64_t const noon = 1'709'294'400 + (number - 1) * 86'400;
        database_.commits().add({number, tav::fromUtf8(hash), L"ann", L"drawn", noon, parents}, {});
    }

    void name(char const* branch, char const* hash)
    {
        database_.commits().set({tav::fromUtf8(branch), tav::fromUtf8(hash), common::EType::branch});
    }

    support::TempRepository const repo_;
    tav::LocalDatabase database_ = tav::LocalDatabase::make(repo_.root());
};

TEST_P(CommitNames, FindTheCommitTheyMean)
{
    EXPECT_EQ(found(GetParam().typed), GetParam().found);
}

INSTANTIATE_TEST_SUITE_P(
    Typed, CommitNames,
    testing::Values(
        Row{"Nothing", "", "5"}, Row{"At", "@", "5"}, Row{"Head", "HEAD", "5"}, Row{"Number", "3", "3"},
        Row{"Branch", "черновик", "3"}, Row{"BranchOfDigits", "4711", "2"}, Row{"Hash", "cafe3", "3"},
        Row{"Prefix", "cafe", "3"}, Row{"ShortPrefix", "caf", "none"}, Row{"PrefixOfDigits", "1234", "4"},
        Row{"OtherHash", "cafe4", "none"}, Row{"PrefixInCapitals", "CAFE", "none"},
        Row{"AmbiguousPrefix", "abcd", "The commits 1 and 2 begin with 'abcd'."}, Row{"Other", "plan.dwg", "none"},
        Row{"OneBefore", "~", "4"}, Row{"OneBeforeHead", "HEAD~", "4"}, Row{"OneBeforeAt", "@~1", "4"},
        Row{"ThreeBefore", "master~3", "1"}, Row{"NoneBefore", "master~0", "5"}, Row{"Parent", "^", "4"},
        Row{"SecondParent", "@^2", "3"}, Row{"Itself", "@^0", "5"}, Row{"Steps", "@^2~", "1"},
        Row{"OfAHash", "cafe3^", "1"}, Row{"OfANumber", "4~2", "1"}, Row{"OfOtherScripts", "設計~1", "1"},
        Row{"WholeNameOfABranch", "old~1", "1"}, Row{"WholeNameOfABranchAndAStep", "old~1~0", "1"},
        Row{"BehindTheFirst", "master~4", "Fewer than 4 commits come before commit 5."},
        Row{"NoThirdParent", "@^3", "Commit 5 has fewer than 3 parents."},
        Row{"NoParent", "1^", "Commit 1 has fewer than 1 parent."},
        Row{"EndlessSteps", "@~9223372036854775807", "Fewer than 9223372036854775807 commits come before commit 5."},
        Row{"TooManySteps", "@~9223372036854775808", "none"}, Row{"StepOfAFile", "plan.dwg~1", "none"},
        Row{"Date", "master@{2024-03-04 13:00Z}", "4"}, Row{"DateOnTheLineOfFirstParents", "@{2024-03-03 13:00Z}", "2"},
        Row{"DateOfABranch", "черновик@{2024-03-05}", "3"}, Row{"DateAndStep", "@{2024-03-04 13:00Z}~1", "2"},
        Row{"DateOfNoBranch", "plan@{2024-03-05}", "none"},
        Row{"DateBeforeTheFirst", "@{2020-01-01}", "No commit had been made by '2020-01-01'."},
        Row{"NoDate", "@{soon}", "'soon' is not a date."}),
    support::rowName);

} // namespace
