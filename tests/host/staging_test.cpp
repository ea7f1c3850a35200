#include "host/changes/staging.h"
#include "host/errors/failure.h"

#include <gmock/gmock.h>

#include <clocale>
#include <string>

namespace {

using common::FileChange;
using common::StagedFile;
using tav::Move;
using testing::ElementsAre;
using testing::IsEmpty;
using testing::Pair;

class Staging : public testing::Test {
protected:
    Staging() { std::setlocale(LC_CTYPE, "C.UTF-8"); }

    std::vector<std::string> staged() const
    {
        std::vector<std::string> texts;
        for (StagedFile const& file : state.stagedFiles) {
            texts.push_back(common::toString(file.change).value().ansi_str() + " " + file.path.ansi_str());
        }
        return texts;
    }

    common::State state;
};

TEST_F(Staging, PutsNewFilesBehindThoseStagedBefore)
{
    EXPECT_EQ(tav::stage({{L"b", FileChange::added}, {L"a", FileChange::modified}}, state), 2u);
    EXPECT_EQ(tav::stage({{L"0", FileChange::removed}}, state), 1u);
    EXPECT_THAT(staged(), ElementsAre("added b", "modified a", "removed 0"));
}

TEST_F(Staging, ChangesAFileStagedBeforeInItsPlace)
{
    tav::stage({{L"a", FileChange::added}, {L"b", FileChange::added}}, state);
    EXPECT_EQ(tav::stage({{L"a", FileChange::removed}, {L"c", FileChange::added}}, state), 1u);
    EXPECT_THAT(staged(), ElementsAre("removed a", "added b", "added c"));
}

TEST_F(Staging, CountsAFileNamedTwiceOnce)
{
    EXPECT_EQ(tav::stage({{L"a", FileChange::added}, {L"a", FileChange::modified}}, state), 1u);
    EXPECT_THAT(staged(), ElementsAre("modified a"));
}

TEST_F(Staging, StagesNothing)
{
    EXPECT_EQ(tav::stage({}, state), 0u);
    EXPECT_THAT(staged(), IsEmpty());
}

TEST_F(Staging, RefusesAPathThatTheStateFileCannotHold)
{
    try {
        tav::stage({{L"\U0001FFFE.dwg", FileChange::added}}, state);
        FAIL() << "no failure";
    } catch (tav::Failure const& failure) {
        EXPECT_EQ(failure.what, "No commit can keep these names.");
        EXPECT_THAT(
            failure.details, ElementsAre("The path '\xf0\x9f\xbf\xbe.dwg' holds a character that cannot be recorded."));
    }
}

TEST_F(Staging, TakesPathsOfEveryScriptAndOfNone)
{
    EXPECT_EQ(
        tav::stage(
            {{L"План", FileChange::added},
             {L"\U0001F3E0", FileChange::added},
             {OdString("\xff", 1, CP_UTF_8), FileChange::added},
             {L"\xFFFE", FileChange::added}},
            state),
        4u);
}

TEST_F(Staging, TakesFilesOutWithTheirRenames)
{
    tav::stage({{L"a", FileChange::added}, {L"b", FileChange::modified}, {L"c", FileChange::removed}}, state);
    state.renames = {{L"a", L"x"}, {L"b", L"y"}};
    EXPECT_EQ(
        tav::unstage({{L"a", FileChange::added}, {L"c", FileChange::added}, {L"z", FileChange::added}}, state), 2u);
    EXPECT_THAT(staged(), ElementsAre("modified b"));
    EXPECT_THAT(state.renames, ElementsAre(Pair(OdString(L"b"), OdString(L"y"))));
}

TEST_F(Staging, StagesAMovedFileWhereItIsNow)
{
    tav::stage({{L"a", FileChange::modified}, {L"z", FileChange::added}}, state);
    tav::stageMoves({{L"a", L"b"}}, state);
    EXPECT_THAT(staged(), ElementsAre("added z", "added b"));
    EXPECT_THAT(state.renames, ElementsAre(Pair(OdString(L"b"), OdString(L"a"))));
}

TEST_F(Staging, RemembersTheFirstPathOfAFileMovedTwice)
{
    tav::stageMoves({{L"a", L"b"}}, state);
    tav::stageMoves({{L"b", L"c"}}, state);
    EXPECT_THAT(staged(), ElementsAre("added c"));
    EXPECT_THAT(state.renames, ElementsAre(Pair(OdString(L"c"), OdString(L"a"))));
}

TEST_F(Staging, ForgetsAFileThatMovedBack)
{
    tav::stageMoves({{L"a", L"b"}}, state);
    tav::stageMoves({{L"b", L"c"}}, state);
    tav::stageMoves({{L"c", L"a"}}, state);
    EXPECT_THAT(staged(), IsEmpty());
    EXPECT_THAT(state.renames, IsEmpty());
}

TEST_F(Staging, SwapsTwoFilesByWayOfAThirdPath)
{
    tav::stageMoves({{L"a", L"c"}}, state);
    tav::stageMoves({{L"b", L"a"}}, state);
    tav::stageMoves({{L"c", L"b"}}, state);
    EXPECT_THAT(staged(), ElementsAre("added a", "added b"));
    EXPECT_THAT(state.renames, ElementsAre(Pair(OdString(L"a"), OdString(L"b")), Pair(OdString(L"b"), OdString(L"a"))));
}

TEST_F(Staging, MovesTheFilesOfAFolderAtOnce)
{
    state.renames = {{L"old/b", L"first"}};
    tav::stage({{L"old/b", FileChange::added}}, state);
    tav::stageMoves({{L"old/a", L"new/a"}, {L"old/b", L"new/b"}}, state);
    EXPECT_THAT(staged(), ElementsAre("added new/a", "added new/b"));
    EXPECT_THAT(
        state.renames,
        ElementsAre(Pair(OdString(L"new/a"), OdString(L"old/a")), Pair(OdString(L"new/b"), OdString(L"first"))));
}

TEST_F(Staging, StagesAFileThatMovedToThePathOfARemovedOneInItsPlace)
{
    tav::stage({{L"b", FileChange::removed}, {L"z", FileChange::added}}, state);
    tav::stageMoves({{L"a", L"b"}}, state);
    EXPECT_THAT(staged(), ElementsAre("added b", "added z"));
}

TEST_F(Staging, TakesAMovedFileForNewWhoseFirstPathTheStateFileCannotHold)
{
    tav::stageMoves({{L"\U0001FFFE.dwg", L"a"}}, state);
    EXPECT_THAT(staged(), ElementsAre("added a"));
    EXPECT_THAT(state.renames, IsEmpty());
}

TEST_F(Staging, RefusesAMoveToAPathThatTheStateFileCannotHold)
{
    EXPECT_THROW(tav::stageMoves({{L"a", L"\U0001FFFE.dwg"}}, state), tav::Failure);
}

} // namespace
