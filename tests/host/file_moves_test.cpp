#include "host/checkout/file_moves.h"
#include "host/errors/failure.h"

#include "platform/os/os_calls.h"
#include "tests/support/failing_call.h"
#include "tests/support/temp_folder.h"

#include <gtest/gtest.h>

#include <cerrno>
#include <string>
#include <unistd.h>

namespace {

class FileMoves : public testing::Test {
protected:
    FileMoves()
    {
        place.write("a", "A");
        place.write("b", "B");
        place.write("folder/c", "C");
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
        tav::FileMoves moves(place.path());
        moves.move("a", "folder/a");
        moves.move("b", "a");
        moves.keep();
    }
    EXPECT_EQ(files(), "a=B folder/a=A folder/c=C ");
}

TEST_F(FileMoves, AreUndoneInReverseOrderOtherwise)
{
    {
        tav::FileMoves moves(place.path());
        moves.move("a", "x");
        moves.move("b", "a");
        moves.move("folder", "b");
        moves.move("x", "b/x");
        EXPECT_EQ(files(), "a=B b/c=C b/x=A ");
    }
    EXPECT_EQ(files(), before);
}

TEST_F(FileMoves, NeverReplaceAFile)
{
    tav::FileMoves moves(place.path());
    moves.move("a", "x");
    try {
        moves.move("x", "b");
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
        tav::FileMoves moves(place.path());
        moves.move("b", "x");
        try {
            moves.move("nothing", "y");
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
        tav::FileMoves moves(place.path());
        EXPECT_THROW(moves.move("nothing", "b"), tav::Failure);
    }
    EXPECT_EQ(files(), before);
}

TEST_F(FileMoves, LeaveTheFileOfAnotherWhereItIsWhenTheirOwnIsGone)
{
    os::Calls const real = os::calls();
    os::calls().renameat2 = [](int folder, char const* from, int, char const*, unsigned) {
        unlinkat(folder, from, 0); // by another program, just before
        errno = ENOENT;
        return -1;
    };
    {
        tav::FileMoves moves(place.path());
        EXPECT_THROW(moves.move("a", "b"), tav::Failure);
        os::calls() = real;
    }
    EXPECT_EQ(files(), "b=B folder/c=C ");
}

TEST_F(FileMoves, AreUndoneWhicheverCallFails)
{
    int n = 0;
    for (bool hasFailed = true; hasFailed; ++n) {
        {
            tav::FileMoves moves(place.path());
            support::FailingCall const failing(n, EIO);
            try {
                moves.move("a", "x");
                moves.move("b", "a");
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
        tav::FileMoves moves(place.path());
        moves.move("a", "x");
        place.write("a", "another");
    }
    EXPECT_EQ(files(), "a=another b=B folder/c=C x=A ");
}

} // namespace
