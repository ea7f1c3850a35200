// Pictures of drawings, of the working folder and of commits.
#include "host/pictures/drawing_picture.h"
#include "host/pictures/png_file.h"

#include "tests/host/tav_test.h"
#include "tests/support/drawing_bytes.h"

#include <filesystem>

namespace host_tests {
namespace {

constexpr tav::Color kWhite = {255, 255, 255};
constexpr tav::Color kBlack = {0, 0, 0};

/// A white picture with black pixels at the upper left.
std::string pngWith(std::uint32_t blackPixels)
{
    tav::Image image(8, 4, kWhite);
    for (std::uint32_t x = 0; x < blackPixels; ++x) {
        image.row(0)[x] = kBlack;
    }
    return tav::encodePng(image);
}

std::string drawingWith(std::uint32_t blackPixels)
{
    return support::drawingOf({{6, pngWith(blackPixels)}});
}

class PreviewTest : public TavTest {
protected:
    PreviewTest()
    {
        tav({"init"});
        commit("plan.dwg", drawingWith(1));
        commit("plan.dwg", drawingWith(3));
    }

    void commit(std::string const& path, std::string const& content) const
    {
        repo.write(path, content);
        tav({"add", "--all"});
        ASSERT_EQ(tav({"commit", "-m", "changes the drawing"}).code, 0);
    }

    std::string picture() const { return repo.read("out.png"); }
};

TEST_F(PreviewTest, WritesThePictureOfTheWorkingFolder)
{
    repo.write("plan.dwg", drawingWith(5));
    EXPECT_EQ(
        tav({"preview", "plan.dwg", "-o", "out.png"}),
        done("Wrote the picture of plan.dwg, 8 x 4 pixels, to 'out.png'.\n"));
    EXPECT_EQ(picture(), pngWith(5));
}

TEST_F(PreviewTest, WritesThePictureOfACommit)
{
    EXPECT_EQ(
        tav({"preview", "plan.dwg@1", "-o", "out.png"}),
        done("Wrote the picture of plan.dwg (commit 1), 8 x 4 pixels, to 'out.png'.\n"));
    EXPECT_EQ(picture(), pngWith(1));
    EXPECT_EQ(tav({"preview", "plan.dwg@HEAD", "-o", "out.png"}).code, 0); // The picture before it is overwritten.
    EXPECT_EQ(picture(), pngWith(3));
}

TEST_F(PreviewTest, FindsTheFileThatHasTheSignInItsName)
{
    repo.write("a@1.dwg", drawingWith(2));
    EXPECT_EQ(tav({"preview", "a@1.dwg", "-o", "out.png"}).code, 0);
    EXPECT_EQ(picture(), pngWith(2));
}

TEST_F(PreviewTest, ShowsAKeptPictureWithoutTheContent)
{
    commit("plan.dwg", drawingWith(6)); // Tests share a cache: no other one has these.
    commit("plan.dwg", drawingWith(7));
    ASSERT_EQ(tav({"preview", "plan.dwg@3", "-o", "out.png"}).code, 0);
    std::filesystem::remove_all(repo.pathTo(".tav/tf"));
    EXPECT_EQ(tav({"preview", "plan.dwg@3", "-o", "out.png"}).code, 0);
    EXPECT_EQ(picture(), pngWith(6));
    EXPECT_EQ(tav({"preview", "plan.dwg@4", "-o", "out.png"}).code, 1);
}

TEST_F(PreviewTest, OverwritesNoDrawing)
{
    std::string const before = repo.read("plan.dwg");
    EXPECT_EQ(
        tav({"preview", "plan.dwg@1", "-o", "plan.dwg"}),
        failed("tav: 'plan.dwg' is there already, and is not a PNG file. Name another file with -o.\n"));
    EXPECT_EQ(repo.read("plan.dwg"), before);
}

TEST_F(PreviewTest, OverwritesNoFileThatBeginsLikeAPicture)
{
    std::string const almost = "\x89PNG\r\n and what else it holds";
    repo.write("notes.txt", almost);
    EXPECT_EQ(
        tav({"preview", "plan.dwg", "-o", "notes.txt"}),
        failed("tav: 'notes.txt' is there already, and is not a PNG file. Name another file with -o.\n"));
    EXPECT_EQ(repo.read("notes.txt"), almost);
}

TEST_F(PreviewTest, OverwritesNothingThatCannotBeRead)
{
    repo.makeFolder("folder");
    EXPECT_EQ(
        tav({"preview", "plan.dwg", "-o", "folder"}),
        failed("tav: 'folder' is there already, and is not a PNG file. Name another file with -o.\n"));
}

TEST_F(PreviewTest, RefusesADrawingThatIsTooLongToBeHeld)
{
    std::filesystem::resize_file(repo.pathTo("plan.dwg"), (std::uintmax_t{1} << 29) + 1);
    EXPECT_EQ(
        tav({"preview", "plan.dwg", "-o", "out.png"}),
        failed("tav: 'plan.dwg' is longer than 512 MB. Longer files are not searched for a picture.\n"));
}

TEST_F(PreviewTest, SaysWhyThereIsNoPicture)
{
    repo.write("notes.txt", "no drawing");
    EXPECT_EQ(
        tav({"preview", "notes.txt", "-o", "out.png"}),
        failed("tav: 'notes.txt' has no picture to show. The bytes are not a drawing. Its editor may be able to save "
               "one.\n"));
    EXPECT_EQ(
        tav({"preview", "plan.dwg"}),
        failed("tav: Pictures cannot be shown here. Write the picture to a file with -o FILE.png.\n"));
    EXPECT_EQ(
        tav({"preview", "nothing.dwg@1", "-o", "out.png"}),
        failed("tav: Commit 1 has no file 'nothing.dwg'. Run 'tav log' to see the commits, and name one drawing.\n"));
}

TEST_F(PreviewTest, IsShownInATerminalThatIsKnownToShowPictures)
{
    Outcome const outcome = tavOnTerminal({"preview", "plan.dwg"}, {"TERM=xterm-kitty", "KITTY_WINDOW_ID=1"});
    EXPECT_EQ(outcome.code, 0);
    EXPECT_THAT(outcome.out, testing::HasSubstr("\x1b_G"));
}

TEST_F(PreviewTest, IsShownInTheHistoryOfADrawingAndInACommit)
{
    std::vector<std::string> const kitty = {"TERM=xterm-kitty", "KITTY_WINDOW_ID=1", "PAGER=cat -v"};
    auto const pictures = [&](Arguments const& arguments) {
        std::string const out = tavOnTerminal(arguments, kitty).out;
        std::size_t count = 0;
        for (std::size_t i = out.find("\x1b_G"); i != std::string::npos; i = out.find("\x1b_G", i + 1)) {
            ++count;
        }
        return count;
    };
    EXPECT_EQ(pictures({"log", "plan.dwg"}), 2U);
    EXPECT_EQ(pictures({"log", "-1", "plan.dwg"}), 1U);
    EXPECT_EQ(pictures({"show", "1"}), 1U);
    EXPECT_EQ(pictures({"log"}), 0U);
    EXPECT_EQ(pictures({"log", "--oneline", "plan.dwg"}), 0U);
    EXPECT_EQ(pictures({"log", "--json", "plan.dwg"}), 0U);
}

TEST_F(PreviewTest, IsLeftOutOfListsWhereItCannotBeShown)
{
    EXPECT_EQ(tav({"show", "1"}).out.find('\x1b'), std::string::npos);
    EXPECT_EQ(
        tavOnTerminal({"log", "plan.dwg"}, {"TERM=xterm", "PAGER=", "NO_COLOR=1"}).out.find("\x1b_G"),
        std::string::npos);
}

TEST_F(PreviewTest, IsLeftOutOfListsForDrawingsWithoutOneAndForOtherFiles)
{
    commit("bare.dwg", "AC1032 without a picture");
    commit("notes.txt", "text");
    for (char const* const name : {"bare.dwg", "notes.txt"}) {
        for (int i = 0; i < 2; ++i) { // The second time it is known.
            Outcome const outcome = tavOnTerminal({"log", name}, {"TERM=xterm-kitty", "KITTY_WINDOW_ID=1"});
            EXPECT_EQ(outcome.code, 0);
            EXPECT_EQ(outcome.out.find("\x1b_G"), std::string::npos);
        }
    }
}

TEST_F(PreviewTest, ComparesTheWorkingFolderWithTheLastCommit)
{
    repo.write("plan.dwg", drawingWith(4));
    EXPECT_EQ(
        tav({"compare", "plan.dwg", "-o", "out.png"}),
        done("plan.dwg (commit 2) and plan.dwg. Pixels that differ: 0 removed, 1 added, 0 recolored.\n"
             "Wrote the comparison to 'out.png'.\n"));
    EXPECT_TRUE(tav::decodePng(picture(), 1U << 20U));
}

TEST_F(PreviewTest, ComparesTwoCommits)
{
    EXPECT_EQ(
        tav({"compare", "plan.dwg", "2", "1", "-o", "out.png", "--json"}),
        done("{\n    \"added\" : 0,\n    \"file\" : \"out.png\",\n    \"path\" : \"plan.dwg\",\n"
             "    \"recolored\" : 0,\n    \"removed\" : 2\n}\n"));
}

TEST_F(PreviewTest, SaysThatTwoPicturesAreAlike)
{
    EXPECT_EQ(
        tav({"compare", "plan.dwg", "1", "1", "-o", "out.png"}).out,
        "plan.dwg (commit 1) and plan.dwg (commit 1). The pictures are identical; the drawings may still "
        "differ.\nWrote the comparison to 'out.png'.\n");
}

} // namespace
} // namespace host_tests
