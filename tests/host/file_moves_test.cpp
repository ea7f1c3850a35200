#include "host/failure.h"
#include "host/repository/file_moves.h"

#include "tests/support/failing_call.h"
#include "tests/support/temp_folder.h"

#include <gtest/gtest.h>

#include <cerrno>
#include <string>

namespace {

class FileMoves : public testing::Test {
protected:
    FileMoves()
    {
        place.write("a", "A");
        place.write("b", "B");
        place.write("folder/c", "C");
    }

    void move(tav::FileMoves& moves, char const* from, char const* to) const
    {
        moves.move(place.pathTo(from), place.pathTo(to));
    }

    /// Names and contents of all files.
    std::string files() const
    {
        std::string text;
        for (std::string const& name : place.list()) {
            text += name.back() == '/' ? "" : name + "=" + place.read(name) + " ";
        }
        return text;
    }

    support::TempFolder const place;
    std::string const before = "a=A b=B folder/c=C ";
};

TEST_F(FileMoves, StandWhenTheyAreKept)
{
    {
        tav::FileMoves moves;
        move(moves, "a", "folder/a");
        move(moves, "b", "a");
        moves.keep();
    }
    EXPECT_EQ(files(), "a=B folder/a=A folder/c=C ");
}

TEST_F(FileMoves, AreUndoneInReverseOrderOtherwise)
{
    {
        tav::FileMoves moves;
        move(moves, "a", "x");
        move(moves, "b", "a");
        move(moves, "folder", "b");
        move(moves, "x", "b/x");
        EXPECT_EQ(files(), "a=B b/c=C b/x=A ");
    }
    EXPECT_EQ(files(), before);
}

TEST_F(FileMoves, NeverReplaceAFile)
{
    tav::FileMoves moves;
    move(moves, "a", "x");
    try {
        move(moves, "x", "b");
        FAIL() << "no failure";
    } catch (tav::Failure const& failure) {
        EXPECT_EQ(failure.what, "'" + place.pathTo("b") + "' exists already.");
        EXPECT_EQ(failure.next, "Choose another name, or move that one away first.");
    }
    EXPECT_EQ(files(), "b=B folder/c=C x=A ");
}

TEST_F(FileMoves, FailWithTheReasonOfTheSystem)
{
    {
        tav::FileMoves moves;
        move(moves, "b", "x");
        try {
            move(moves, "nothing", "y");
            FAIL() << "no failure";
        } catch (tav::Failure const& failure) {
            EXPECT_EQ(
                failure.what, "'" + place.pathTo("nothing") + "' cannot be moved to '" + place.pathTo("y") +
                                  "': No such file or directory.");
            EXPECT_EQ(failure.next, "Check that the folder exists and that you may write there.");
        }
    }
    EXPECT_EQ(files(), before);
}

TEST_F(FileMoves, DoNotTakeBackWhatNeverHappened)
{
    {
        tav::FileMoves moves;
        EXPECT_THROW(move(moves, "nothing", "b"), tav::Failure);
    }
    EXPECT_EQ(files(), before);
}

TEST_F(FileMoves, AreUndoneWhicheverCallFails)
{
    int n = 0;
    for (bool hasFailed = true; hasFailed; ++n) {
        {
            tav::FileMoves moves;
            support::FailingCall const failing(n, EIO);
            try {
                move(moves, "a", "x");
                move(moves, "b", "a");
            } catch (tav::Failure const&) {
                EXPECT_TRUE(failing.hasFailed());
            }
            hasFailed = failing.hasFailed();
        }
        EXPECT_EQ(files(), before) << "failing call " << n;
    }
    EXPECT_GT(n, 2);
}

TEST_F(FileMoves, LeaveAFileUnderItsNewNameWhenTheOldOneIsTakenByThen)
{
    {
        tav::FileMoves moves;
        move(moves, "a", "x");
        place.write("a", "another");
    }
    EXPECT_EQ(files(), "a=another b=B folder/c=C x=A ");
}

} // namespace
