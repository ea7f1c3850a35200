#include "tests/config/configurations.h"
#include "tests/server/translations.h"
#include "tests/support/allocations.h"

#include "tests/support/as_ordinary_user.h"
#include "tests/support/recording_io.h"
#include "tests/support/rows.h"

#include <gmock/gmock.h>
#include <new>
#include <sys/stat.h>

namespace {

using namespace configurations;
using support::RecordingIo;
using support::TempFolder;
using testing::ElementsAre;
using testing::IsEmpty;

std::string mismatch(std::string const& wanted, std::string const& found, std::string const& key)
{
    std::string const place = key.empty() ? "" : "\njson key:\t\"" + key + "\"";
    return "error: Error:\tExpected json type '" + wanted + "', found '" + found + "'" + place;
}

std::string missing(std::string const& key)
{
    return "error: Unable to find json key '" + key + "'\njson key:\t\"" + key + "\"";
}

std::string const kNoJson = "error: Unable to parse json, please check if syntax is valid";

std::string map(std::string const& elements)
{
    return R"({"projects_map": [)" + elements + "]}";
}

std::string const kHouse = R"({"info": {"name": "House", "uid": "1"}, "path": "/house"})";

struct FileRow {
    char const* name;
    std::string content;
    std::string outcome;
};

void PrintTo(FileRow const& row, std::ostream* out)
{
    *out << row.content;
}

class ConfigFile : public testing::TestWithParam<FileRow> {
protected:
    std::string loadedFrom(std::string const& content) const
    {
        folder.write(kFile, content);
        std::string const outcome = loaded(folder.widePath(), io);
        EXPECT_EQ(folder.read(kFile), content);
        EXPECT_THAT(io.calls(), IsEmpty());
        return outcome;
    }

    TempFolder const folder;
    RecordingIo const io;
};

INSTANTIATE_TEST_SUITE_P(
    Documents, ConfigFile,
    testing::Values(
        FileRow{"EmptyObject", "{}", "no projects"}, FileRow{"NoProjects", map(""), "no projects"},
        FileRow{"OneProject", map(kHouse), "/house = House (1)"},
        FileRow{
            "AnyOrder", map(R"({"path": "/z", "info": {"uid": "2", "name": "Z"}}, )" + kHouse),
            "/house = House (1), /z = Z (2)"},
        FileRow{
            "FirstOfTwoWithOnePath", map(kHouse + R"(, {"info": {"name": "Other", "uid": "2"}, "path": "/house"})"),
            "/house = House (1)"},
        FileRow{"EmptyTexts", map(R"({"info": {"name": "", "uid": ""}, "path": ""})"), " =  ()"},
        FileRow{
            "UnknownMembers",
            R"({"version": 2, "projects": 5, "projects_map": [{"info": {"name": "House", "uid": "1", "x": []},
                   "path": "/house", "Path": 7}]})",
            "/house = House (1)"},
        FileRow{
            "BeyondAscii", map("{\"info\": {\"name\": \"Br\u00FCcke\", \"uid\": \"\\u00FC\"}, \"path\": \"/\u6A4B\"}"),
            "/\u6A4B = Br\u00FCcke (\u00FC)"},
        FileRow{
            "NoValidEncoding", map("{\"info\": {\"name\": \"\xFF\", \"uid\": \"\"}, \"path\": \"/\xC3\"}"),
            "/\xC3 = \xFF ()"},
        FileRow{
            "Nul", map(R"({"info": {"name": "a\u0000b", "uid": ""}, "path": "/"})"), std::string("/ = a\0b ()", 10)},
        FileRow{"ByteOrderMark", "\xEF\xBB\xBF" + map(kHouse), "/house = House (1)"},
        FileRow{"CarriageReturns", "{\r\n\"projects_map\"\r\n: []\r\n}\r\n", "no projects"},
        FileRow{"TextBehind", "{} and more", "no projects"}),
    support::rowName);

INSTANTIATE_TEST_SUITE_P(
    NoJson, ConfigFile,
    testing::Values(
        FileRow{"Empty", "", kNoJson}, FileRow{"Blanks", " \n", kNoJson}, FileRow{"Words", "projects", kNoJson},
        FileRow{"CutOff", "{\"projects_map\": [", kNoJson}, FileRow{"LoneComma", "{,}", kNoJson},
        FileRow{"NulFirst", std::string("\0{}", 3), kNoJson}),
    support::rowName);

INSTANTIATE_TEST_SUITE_P(
    OtherShapes, ConfigFile,
    testing::Values(
        FileRow{"ArrayAsRoot", "[]", mismatch("object", "array", "")},
        FileRow{"NullAsRoot", "null", mismatch("object", "null", "")},
        FileRow{"IntAsRoot", "7", mismatch("object", "int", "")},
        FileRow{"StringAsRoot", "\"{}\"", mismatch("object", "string", "")},
        FileRow{"RealAsRoot", "1.5", mismatch("object", "real", "")},
        FileRow{"BoolAsRoot", "true", mismatch("object", "bool", "")},
        FileRow{"ObjectAsMap", R"({"projects_map": {}})", mismatch("array", "object", "projects_map")},
        FileRow{"NullAsMap", R"({"projects_map": null})", mismatch("array", "null", "projects_map")},
        FileRow{
            "TextAsProject", map(kHouse + ", \"/z\""),
            "error: Encounterd 'object', found 'string. While parsing json map.'"},
        FileRow{"NullAsProject", map("null"), "error: Encounterd 'object', found 'null. While parsing json map.'"},
        FileRow{"ArrayAsInfo", map(R"({"info": [], "path": 1})"), mismatch("object", "array", "info")},
        FileRow{"IntAsPath", map(R"({"info": {}, "path": 1})"), mismatch("string", "int", "path")},
        FileRow{
            "BoolAsName", map(R"({"info": {"name": true, "uid": 1}, "path": ""})"), mismatch("string", "bool", "name")},
        FileRow{
            "NullAsUid", map(R"({"info": {"name": "", "uid": null}, "path": ""})"), mismatch("string", "null", "uid")}),
    support::rowName);

INSTANTIATE_TEST_SUITE_P(
    MissingMembers, ConfigFile,
    testing::Values(
        FileRow{"All", map("{}"), missing("info")}, FileRow{"Info", map(R"({"path": "/house"})"), missing("info")},
        FileRow{"PathAndNames", map(R"({"info": {}})"), missing("path")},
        FileRow{"NameAndUid", map(R"({"info": {}, "path": ""})"), missing("name")},
        FileRow{"Name", map(R"({"info": {"uid": 1}, "path": ""})"), missing("name")},
        FileRow{"Uid", map(R"({"info": {"name": ""}, "path": ""})"), missing("uid")},
        FileRow{"UidUnderTheNameOfTheField", map(R"({"info": {"name": "", "cloud": ""}, "path": ""})"), missing("uid")},
        FileRow{"InTheSecondProject", map(kHouse + ", {}"), missing("info")}),
    support::rowName);

TEST_P(ConfigFile, IsReadAsItIsAndLeftAsItWas)
{
    EXPECT_EQ(loadedFrom(GetParam().content), GetParam().outcome);
}

TEST_F(ConfigFile, OfAnyDepthIsRefusedOrPassedOver)
{
    std::string const deep = std::string(200'000, '[') + std::string(200'000, ']');
    EXPECT_EQ(loadedFrom(deep), mismatch("object", "array", ""));
    EXPECT_EQ(loadedFrom(std::string(200'000, '[')), kNoJson);
    EXPECT_EQ(loadedFrom(R"({"other": )" + deep + "}"), "no projects");
    EXPECT_EQ(loadedFrom(map(deep)), "error: Encounterd 'object', found 'array. While parsing json map.'");
}

TEST_F(ConfigFile, ThatIsCutOffAnywhereIsRefused)
{
    std::string const whole = map(kHouse);
    for (std::size_t length = 0; length < whole.size(); ++length) {
        EXPECT_EQ(loadedFrom(whole.substr(0, length)), kNoJson) << "cut at " << length;
    }
}

TEST_F(ConfigFile, ThatIsAFolderIsRefused)
{
    folder.makeFolder(kFile);
    EXPECT_EQ(
        loaded(folder.widePath(), io), "error: Could not read file '" + folder.pathTo(kFile) + "': Is a directory");
}

TEST_F(ConfigFile, ThatMayNotBeReadIsRefused)
{
    folder.write(kFile, "{}");
    ASSERT_EQ(chmod(folder.path().c_str(), 0777), 0);
    ASSERT_EQ(chmod(folder.pathTo(kFile).c_str(), 0), 0);
    EXPECT_EQ(
        support::asOrdinaryUser([&] { return loaded(folder.widePath(), io); }),
        "error: Could not read file '" + folder.pathTo(kFile) + "': Permission denied");
}

TEST_F(ConfigFile, ThatIsADanglingLinkIsMissing)
{
    folder.makeLink(kFile, "nowhere");
    EXPECT_EQ(loaded(folder.widePath(), io), "no projects");
}

TEST_F(ConfigFile, IsNotMadeByLoading)
{
    EXPECT_EQ(loaded(folder.widePathTo("a/b"), io), "no projects");
    EXPECT_THAT(folder.list(), ElementsAre("a/", "a/b/"));
    EXPECT_THAT(io.calls(), IsEmpty());
}

TEST_F(ConfigFile, IsNotLookedForInAFolderThatIsRefused)
{
    EXPECT_EQ(loaded(L"", io), "error: VC config path is empty.");
    EXPECT_EQ(loaded(L"mu_missing", io), "error: The path mu_missing is not valid.");
}

TEST_F(ConfigFile, IsRefusedInTheLanguageOfTheUser)
{
    server::Translations const translations(
        {"Unable to parse json, please check if syntax is valid", "Unable to find json key '%ls'",
         "Encounterd '%ls', found '%ls. While %ls'", "Error:\tExpected json type '%ls', found '%ls'"});
    EXPECT_EQ(loadedFrom("x"), "error: {Unable to parse json, please check if syntax is valid}");
    EXPECT_EQ(loadedFrom(map("{}")), missing("info"));
    EXPECT_EQ(loadedFrom(map("5")), "error: Encounterd 'object', found 'int. While parsing json map.'");
    EXPECT_EQ(loadedFrom("[]"), mismatch("object", "array", ""));
}

TEST(ConfigFileThatCannotBeRead, IsNamedAsItIs)
{
    TempFolder const folder;
    RecordingIo const io;
    folder.makeFolder("100%ls%n/directories.state");
    EXPECT_EQ(
        loaded(folder.widePathTo("100%ls%n"), io),
        "error: Could not read file '" + folder.pathTo("100%ls%n/directories.state") + "': Is a directory");
}

// What is no `OdError` passes through.
TEST(ConfigFileTooLargeForTheMemory, IsNotTakenForAWrongOne)
{
    TempFolder const folder;
    RecordingIo const io;
    folder.write(kFile, "{\"other\": \"" + std::string(1'000'000, 'p') + "\"}");
    auto const loadIt = [&] { static_cast<void>(common::Config::load(folder.widePath(), io)); };
    support::RefusedAllocations const refused(2'000'000);
    EXPECT_THROW(loadIt(), std::bad_alloc);
}

} // namespace
