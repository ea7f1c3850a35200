#include "host/merge/text_merge.h"

#include <gmock/gmock.h>

#include <string>

namespace {

using tav::mergeLines;
using testing::Eq;
using testing::Optional;

TEST(TextMerge, TakesTheChangesOfBothSides)
{
    EXPECT_THAT(mergeLines("a\nb\nc\nd\n", "A\nb\nc\nd\n", "a\nb\nc\nD\n"), Optional(Eq("A\nb\nc\nD\n")));
}

TEST(TextMerge, TakesLinesThatOneSideAddedAndTheOtherRemovedElsewhere)
{
    EXPECT_THAT(mergeLines("a\nb\nc\n", "new\na\nb\nc\n", "a\nb\n"), Optional(Eq("new\na\nb\n")));
}

TEST(TextMerge, TakesASameChangeOnce)
{
    EXPECT_THAT(mergeLines("a\nb\nc\n", "a\nB\nc\n", "a\nB\nc\n"), Optional(Eq("a\nB\nc\n")));
    EXPECT_THAT(mergeLines("a\n", "a\nb\n", "a\nb\n"), Optional(Eq("a\nb\n")));
}

TEST(TextMerge, KeepsALastLineWithoutEnd)
{
    EXPECT_THAT(mergeLines("a\nb\nc", "A\nb\nc", "a\nb\nC"), Optional(Eq("A\nb\nC")));
}

TEST(TextMerge, DoesNotMergeChangesOfTheSameLine)
{
    EXPECT_THAT(mergeLines("a\nb\nc\n", "a\n1\nc\n", "a\n2\nc\n"), Eq(std::nullopt));
}

TEST(TextMerge, DoesNotMergeChangesThatTouch)
{
    EXPECT_THAT(mergeLines("a\nb\nc\nd\n", "a\n1\nc\nd\n", "a\nb\n2\nd\n"), Eq(std::nullopt));
    EXPECT_THAT(mergeLines("a\nb\n", "a\nmine\nb\n", "a\ntheirs\nb\n"), Eq(std::nullopt));
    EXPECT_THAT(mergeLines("", "mine\n", "theirs\n"), Eq(std::nullopt));
}

TEST(TextMerge, MergesChangesWithOneLineBetween)
{
    EXPECT_THAT(mergeLines("a\nb\nc\n", "A\nb\nc\n", "a\nb\nC\n"), Optional(Eq("A\nb\nC\n")));
}

TEST(TextMerge, MergesTextsWithTheLineEndsOfWindows)
{
    EXPECT_THAT(mergeLines("a\r\nb\r\nc\r\n", "A\r\nb\r\nc\r\n", "a\r\nb\r\nC\r\n"), Optional(Eq("A\r\nb\r\nC\r\n")));
}

TEST(TextMerge, DoesNotMergeTextsWithDifferentLineEnds)
{
    EXPECT_THAT(mergeLines("a\nb\nc\n", "A\nb\nc\n", "a\r\nb\r\nC\r\n"), Eq(std::nullopt));
    EXPECT_THAT(mergeLines("a\nb\r\nc\n", "A\nb\r\nc\n", "a\nb\r\nC\n"), Eq(std::nullopt));
}

TEST(TextMerge, TakesANulForASignOfOtherThanTextInTheFirst8000BytesOnly)
{
    std::string const lines(8'000, 'x');
    std::string const late = lines + std::string("\0\nb\nc\n", 6);
    std::string const early = lines.substr(1) + std::string("\0\nb\nc\n", 6);
    EXPECT_THAT(mergeLines(late, "A" + late, late + "D\n"), Optional(Eq("A" + late + "D\n")));
    EXPECT_THAT(mergeLines(early, "A" + early, early + "D\n"), Eq(std::nullopt));
}

TEST(TextMerge, TakesTextsOfAMebibyteAndNoLongerOnes)
{
    std::string const base = std::string((std::size_t{1} << 20) - 5, 'x') + "\nb\nc";
    ASSERT_EQ(base.size() + 1, std::size_t{1} << 20);
    std::string const theirs = base.substr(0, base.size() - 1) + "C";
    EXPECT_THAT(mergeLines(base, "y" + base, theirs), Optional(Eq("y" + theirs)));
    EXPECT_THAT(mergeLines(base, "yy" + base, theirs), Eq(std::nullopt));
}

TEST(TextMerge, TakesFiftyThousandLinesAndNoMore)
{
    std::string base;
    for (int i = 0; i < 49'999; ++i) {
        base += "x\n";
    }
    EXPECT_THAT(mergeLines(base, "a\n" + base, base), Optional(Eq("a\n" + base)));
    EXPECT_THAT(mergeLines(base, "a\nb\n" + base, base), Eq(std::nullopt));
}

} // namespace
