#include "host/commits/similar_files.h"

#include "host/text/utf8.h"

#include <gmock/gmock.h>

#include <string>
#include <vector>

namespace {

using testing::ElementsAre;
using testing::IsEmpty;

/// The names of the files that `path` may resemble; each file has its name as URL.
std::vector<std::string> similarTo(char const* path, std::vector<std::string> const& names)
{
    tav::Tree files;
    for (std::string const& name : names) {
        files[tav::fromUtf8(name)] = tav::fromUtf8(name);
    }
    std::vector<std::string> similar;
    for (OdString const& url : tav::similarFiles(files, tav::fromUtf8(path))) {
        similar.push_back(url.ansi_str());
    }
    return similar;
}

TEST(SimilarFiles, AreTwoOnEachSideAndTheNearestOneBeforeIsTheFirst)
{
    EXPECT_THAT(
        similarTo("4.dwg", {"1.dwg", "2.dwg", "3.dwg", "5.dwg", "6.dwg", "7.dwg"}),
        ElementsAre("3.dwg", "2.dwg", "5.dwg", "6.dwg"));
}

TEST(SimilarFiles, AreNeverTheFileItself)
{
    EXPECT_THAT(similarTo("2.dwg", {"1.dwg", "2.dwg", "3.dwg"}), ElementsAre("1.dwg", "3.dwg"));
    EXPECT_THAT(similarTo("1.dwg", {"1.dwg"}), IsEmpty());
    EXPECT_THAT(similarTo("1.dwg", {}), IsEmpty());
}

TEST(SimilarFiles, HaveTheSameExtensionLetterCaseAside)
{
    EXPECT_THAT(similarTo("b.DWG", {"a.dwg", "a.dxf", "c.pdf", "d.Dwg", "e.dwg.bak"}), ElementsAre("a.dwg", "d.Dwg"));
}

TEST(SimilarFiles, TakeNoDotOfAFolderForAnExtension)
{
    EXPECT_THAT(similarTo("v1.dwg/b", {"v1.dwg/a", "v1.dwg/c.dwg"}), ElementsAre("v1.dwg/a"));
}

TEST(SimilarFiles, AreSearchedAmongSixteenOnEachSide)
{
    std::vector<std::string> names = {"a.dwg", "z.dwg"};
    for (char c = 'b'; c < 'q'; ++c) {
        names.push_back(std::string(1, c) + ".txt");
    }
    EXPECT_THAT(similarTo("q.dwg", names), ElementsAre("a.dwg", "z.dwg")) << "fifteen others are between";
    names.push_back("pp.txt");
    EXPECT_THAT(similarTo("q.dwg", names), ElementsAre("z.dwg")) << "sixteen others are between";
}

} // namespace
