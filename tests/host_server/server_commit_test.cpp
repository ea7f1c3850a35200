#include "tests/host_server/server_test.h"
#include "tests/support/rows.h"

#include <gtest/gtest.h>

namespace {

using server::commit;
using server::replaced;

class ServerCommit : public server::ServerTest {
protected:
    std::string send(std::string const& document) { return ask("commit <id>", document); }
    std::string references() { return ask("references <id>", "[]"); }
    std::string everything() { return ask("fetch <id>", "[]"); }
};

TEST_F(ServerCommit, GivesCommitsRunningNumbers)
{
    EXPECT_EQ(send(commit('a', "", {"plan.dwg 1"}, {"branch main a"})), R"([{"commitNo":1,"hash":"<a>"}])");
    EXPECT_EQ(
        send(commit('b', "a", {"plan.dwg 2"}, {"branch main b", "tag v1 a"})), R"([{"commitNo":2,"hash":"<b>"}])");
    EXPECT_EQ(references(), server::references({"branch main b", "tag v1 a"}));
}

TEST_F(ServerCommit, NumbersEachRepositoryByItself)
{
    send(commit('a', "", {}, {}));
    EXPECT_EQ(ask("commit " + init("house"), commit('a', "", {}, {})), R"([{"commitNo":1,"hash":"<a>"}])");
}

TEST_F(ServerCommit, AnswersARepeatedOneAsTheFirst)
{
    std::string const first = commit('a', "", {"plan.dwg 1"}, {"branch main a", "tag v1 a"});
    send(first);
    std::string const before = everything();
    EXPECT_EQ(send(first), R"([{"commitNo":1,"hash":"<a>"}])");
    EXPECT_EQ(everything(), before);
}

TEST_F(ServerCommit, LeavesABranchThatWentPastARepeatedOne)
{
    std::string const first = commit('a', "", {}, {"branch main a"});
    send(first);
    send(commit('b', "a", {}, {"branch main b"}));
    EXPECT_EQ(send(first), R"([{"commitNo":1,"hash":"<a>"}])");
    EXPECT_EQ(references(), server::references({"branch main b"}));
}

TEST_F(ServerCommit, MovesTheBranchOfARepeatedOneForward)
{
    send(commit('a', "", {}, {"branch main a"}));
    send(commit('b', "a", {}, {}));
    send(commit('b', "a", {}, {"branch main b"}));
    EXPECT_EQ(references(), server::references({"branch main b"}));
}

TEST_F(ServerCommit, TakesAMergeOfTwoParents)
{
    send(commit('a', "", {}, {"branch main a"}));
    send(commit('b', "a", {}, {"branch main b"}));
    send(commit('c', "a", {"side 1"}, {"branch side c"}));
    EXPECT_EQ(send(commit('d', "bc", {}, {"branch main d", "branch side d"})), R"([{"commitNo":4,"hash":"<d>"}])");
}

TEST_F(ServerCommit, KeepsOthersFromBeingOverwritten)
{
    send(commit('a', "", {}, {"branch main a"}));
    send(commit('b', "a", {}, {"branch main b"}));
    std::string const before = everything();
    EXPECT_EQ(
        send(commit('c', "a", {"plan 1"}, {"branch main c"})),
        "error: The branch 'main' has commits that the new one does not follow. Merge what others have done, or "
        "send it as a branch of its own.");
    EXPECT_EQ(everything(), before) << "the commit itself must not stay either";
}

TEST_F(ServerCommit, MovesReferencesAnywhereWhenForced)
{
    send(commit('a', "", {}, {"branch main a", "tag v1 a"}));
    send(commit('b', "a", {}, {"branch main b"}));
    EXPECT_EQ(
        ask("force-commit <id>", commit('c', "a", {"plan 1"}, {"branch main c", "tag v1 c"})),
        R"([{"commitNo":3,"hash":"<c>"}])");
    EXPECT_EQ(references(), server::references({"branch main c", "tag v1 c"}));
}

TEST_F(ServerCommit, RefusesASecondBeginning)
{
    send(commit('a', "", {}, {"branch main a"}));
    EXPECT_EQ(
        send(commit('b', "", {"plan 1"}, {})),
        "error: The repository has commits already; one without a parent would not follow them. Merge what others "
        "have done, or send it as a branch of its own.");
}

TEST_F(ServerCommit, MayBeginAnewWhenTheFirstOneHasBeenTakenBack)
{
    send(commit('a', "", {}, {"branch main a"}));
    EXPECT_EQ(ask("references <id>", R"([{"commitHash":"","expected":"<a>","name":"main","refType":"branch"}])"), "[]");
    EXPECT_EQ(send(commit('b', "", {"plan 1"}, {"branch main b -"})), R"([{"commitNo":2,"hash":"<b>"}])");
}

TEST_F(ServerCommit, MayReplaceTheFirstOneWhereItsBranchIsTheOnlyReference)
{
    send(commit('a', "", {}, {"branch main a"}));
    EXPECT_EQ(send(commit('b', "", {"plan 1"}, {"branch main b a"})), R"([{"commitNo":2,"hash":"<b>"}])");
    EXPECT_EQ(references(), server::references({"branch main b"}));
    ask("references <id>", R"([{"commitHash":"<a>","name":"v1","refType":"tag"}])");
    EXPECT_EQ(
        send(commit('c', "", {"plan 3"}, {"branch main c b"})),
        "error: The repository has commits already; one without a parent would not follow them. Merge what others "
        "have done, or send it as a branch of its own.");
}

TEST_F(ServerCommit, RefusesAnUnknownParent)
{
    EXPECT_EQ(
        send(commit('b', "a", {}, {})),
        "error: The server does not have the parent commit '<a>'. Nothing has changed on the server.");
}

TEST_F(ServerCommit, RefusesAReferenceToAnUnknownCommit)
{
    EXPECT_EQ(
        send(commit('a', "", {}, {"branch main b"})),
        "error: The server does not have the commit '<b>' of 'main'. Nothing has changed on the server.");
    EXPECT_EQ(send(commit('a', "", {}, {})), R"([{"commitNo":1,"hash":"<a>"}])");
}

TEST_F(ServerCommit, RefusesToMoveATag)
{
    send(commit('a', "", {}, {"tag v1 a"}));
    EXPECT_EQ(
        send(commit('b', "a", {}, {"tag v1 b"})),
        "error: The tag 'v1' names another commit already. Choose another name.");
}

TEST_F(ServerCommit, RefusesToMakeABranchOfATagAlsoWhenForced)
{
    send(commit('a', "", {}, {"tag v1 a", "branch main a"}));
    EXPECT_EQ(
        send(commit('b', "a", {}, {"branch v1 b"})), "error: 'v1' is the name of a tag already. Choose another name.");
    EXPECT_EQ(
        ask("force-commit <id>", commit('b', "a", {}, {"tag main b"})),
        "error: 'main' is the name of a branch already. Choose another name.");
}

TEST_F(ServerCommit, LeavesABranchThatItIsNotExpectedToFind)
{
    send(commit('a', "", {}, {"branch main a -"}));
    EXPECT_EQ(
        send(commit('b', "a", {}, {"branch main b -"})),
        "error: There is a branch 'main' already. Choose another name.");
    EXPECT_EQ(send(commit('b', "a", {}, {"branch main b a"})), R"([{"commitNo":2,"hash":"<b>"}])");
    EXPECT_EQ(
        send(commit('c', "b", {}, {"branch main c a"})),
        "error: The branch 'main' now names a different commit. Fetch what others have done, and try again.");
}

TEST_F(ServerCommit, RefusesAHashThatDoesNotFollowFromWhatIsInIt)
{
    send(commit('0', "", {}, {}));
    std::string const good = commit('a', "0", {"plan.dwg 1", "new.dwg 2 old.dwg"}, {});
    for (auto const& [what, with] : std::vector<std::pair<std::string, std::string>>{
             {"\"ann\"", "\"bob\""},
             {"moves", "removes"},
             {"plan.dwg", "roof.dwg"},
             {"po:<1>", "po:<2>"},
             {"old.dwg", "older.dwg"},
             {"\"<0>\"", ""}}) {
        std::string const document = replaced(good, what, with);
        server::renameCommit('z', document);
        EXPECT_EQ(
            send(document), "error: 'commits[0].hash' is '<a>', but the hash of this commit is '<z>'. Nothing has "
                            "changed on the server.")
            << what;
    }
    EXPECT_EQ(send(good), R"([{"commitNo":2,"hash":"<a>"}])");
}

TEST_F(ServerCommit, HasTheHashThatTheProtocolDescribes)
{
    tav::CommitRecord commit;
    commit.author = L"ann@studio";
    commit.message = L"first";
    commit.parents = {server::wideText(std::string(64, 'p'))};
    std::vector<tav::FileRecord> const files = {{L"b.dwg", L"po:b", L"old.dwg"}, {L"a.dwg", L"po:a", OdString()}};
    EXPECT_EQ(
        tav::commitHash(commit, files).ansi_str(), "8f828f322f599dceffab1869022ac2166905b997cf84f7864e425a332f9779e2");
}

TEST_F(ServerCommit, RefusesAFileThatIsTheFolderOfAnotherWhateverStandsBetween)
{
    EXPECT_EQ(
        send(commit('a', "", {"a/b 1", "a!c 1", "a 1"}, {})),
        "error: 'commits[0].files' must not hold 'a' both as a file and as a folder. Nothing has changed on the "
        "server.");
    EXPECT_EQ(send(commit('a', "", {"a/b 1", "a!c 1", "ab 1", "a/c/d 1"}, {})), R"([{"commitNo":1,"hash":"<a>"}])");
}

struct Row {
    char const* name;
    std::string what; ///< of a good document
    std::string with;
    std::string message;
};

class ServerCommitRefusal
    : public ServerCommit
    , public testing::WithParamInterface<Row> {};

TEST_P(ServerCommitRefusal, NamesTheMemberAndChangesNothing)
{
    std::string const good = commit('a', "", {"plan.dwg 1", "new.dwg 2 old.dwg"}, {"branch main a"});
    std::string const before = everything();
    EXPECT_EQ(
        send(replaced(good, GetParam().what, GetParam().with)),
        "error: " + GetParam().message + " Nothing has changed on the server.");
    EXPECT_EQ(everything(), before);
    EXPECT_EQ(send(good), R"([{"commitNo":1,"hash":"<a>"}])");
}

std::string type(std::string const& place, std::string const& wanted, std::string const& found)
{
    return "'" + place + "' must be of type " + wanted + ", not " + found + ".";
}

INSTANTIATE_TEST_SUITE_P(
    Shape, ServerCommitRefusal,
    testing::Values(
        Row{"NoJson", "{", "", "The document must be of type object, not string."},
        Row{"NoJsonAtAll", "{\"commits\"", "#", "The document is not valid JSON."},
        Row{"NoCommits", "\"commits\"", "\"c\"", "The document lacks the member 'commits'."},
        Row{"NoAnnotation", "\"annotation\"", "\"c\"", "'commits[0]' lacks the member 'annotation'."},
        Row{"NoAuthor", "\"author\"", "\"c\"", "'commits[0].annotation' lacks the member 'author'."},
        Row{"NoDate", "\"date\"", "\"c\"", "'commits[0].annotation' lacks the member 'date'."},
        Row{"NoMessage", "\"message\"", "\"c\"", "'commits[0].annotation' lacks the member 'message'."},
        Row{"NoFiles", "\"files\"", "\"c\"", "'commits[0]' lacks the member 'files'."},
        Row{"NoPath", "\"path\"", "\"c\"", "'commits[0].files[0]' lacks the member 'path'."},
        Row{"NoStoragePath", "\"storagePath\"", "\"c\"", "'commits[0].files[0]' lacks the member 'storagePath'."},
        Row{"NoHash", "\"hash\"", "\"c\"", "'commits[0]' lacks the member 'hash'."},
        Row{"NoParents", "\"parentsHashes\"", "\"c\"", "'commits[0]' lacks the member 'parentsHashes'."},
        Row{"NoReferences", "\"references\"", "\"c\"", "The document lacks the member 'references'."},
        Row{"NoCommitHash", "\"commitHash\"", "\"c\"", "'references[0]' lacks the member 'commitHash'."},
        Row{"NoName", "\"name\"", "\"c\"", "'references[0]' lacks the member 'name'."},
        Row{"NoType", "\"refType\"", "\"c\"", "'references[0]' lacks the member 'refType'."},
        Row{"CommitsOfWrongType", "\"commits\":", "\"commits\":1,\"c\":", type("commits", "array", "int")},
        Row{"CommitOfWrongType", "[{\"annotation", "[[],{\"annotation", "'commits' must hold one commit, not 2."},
        Row{"NoCommit", "\"commits\":", "\"commits\":[],\"c\":", "'commits' must hold one commit, not 0."},
        Row{"AnnotationOfWrongType",
            "\"annotation\":", "\"annotation\":null,\"c\":", type("commits[0].annotation", "object", "null")},
        Row{"AuthorOfWrongType", "\"ann\"", "{}", type("commits[0].annotation.author", "string", "object")},
        Row{"MessageOfWrongType", "\"moves the stairs\"", "1.5",
            type("commits[0].annotation.message", "string", "real")},
        Row{"DateOfWrongType", "\"2024-03-05T14:07:09Z\"", "1709647629.0",
            type("commits[0].annotation.date", "string", "real")},
        Row{"FilesOfWrongType", "\"files\":", "\"files\":{},\"c\":", type("commits[0].files", "array", "object")},
        Row{"FileOfWrongType", "\"files\":[", "\"files\":[true,", type("commits[0].files[0]", "object", "bool")},
        Row{"PathOfWrongType", "\"new.dwg\"", "[]", type("commits[0].files[1].path", "string", "array")},
        Row{"PreviousPathOfWrongType", "\"old.dwg\"", "null",
            type("commits[0].files[1].previousPath", "string", "null")},
        Row{"StoragePathOfWrongType", "\"po:<2>\"", "7", type("commits[0].files[1].storagePath", "string", "int")},
        Row{"HashOfWrongType", "\"hash\":", "\"hash\":false,\"c\":", type("commits[0].hash", "string", "bool")},
        Row{"ParentsOfWrongType",
            "\"parentsHashes\":", "\"parentsHashes\":\"\",\"c\":", type("commits[0].parentsHashes", "array", "string")},
        Row{"ParentOfWrongType", "\"parentsHashes\":[", "\"parentsHashes\":[3",
            type("commits[0].parentsHashes[0]", "string", "int")},
        Row{"ReferencesOfWrongType",
            "\"references\":", "\"references\":null,\"c\":", type("references", "array", "null")},
        Row{"ReferenceOfWrongType", "\"references\":[", "\"references\":[0,", type("references[0]", "object", "int")},
        Row{"NameOfWrongType", "\"main\"", "1", type("references[0].name", "string", "int")},
        Row{"RefTypeOfWrongType", "\"branch\"", "1", type("references[0].refType", "string", "int")}),
    support::rowName);

std::string const kHash = " must be a hash of 64 lower-case hexadecimal digits.";
std::string const kDate = "'commits[0].annotation.date' must be a time such as '2024-03-05T14:07:09Z'.";
std::string const kUrl =
    "'commits[0].files[0].storagePath' must name a content, such as 'po:' or 'tf:plan#' followed by a hash.";

INSTANTIATE_TEST_SUITE_P(
    Content, ServerCommitRefusal,
    testing::Values(
        Row{"ShortHash", "\"hash\":\"<a>\"", "\"hash\":\"aa\"", "'commits[0].hash'" + kHash},
        Row{"HashInCapitals", "\"hash\":\"<a>\"", "\"hash\":\"<A>\"", "'commits[0].hash'" + kHash},
        Row{"HashOfOtherLetters", "\"hash\":\"<a>\"", "\"hash\":\"<g>\"", "'commits[0].hash'" + kHash},
        Row{"NoHashAsParent", "\"parentsHashes\":[", "\"parentsHashes\":[\"\"",
            "'commits[0].parentsHashes[0]'" + kHash},
        Row{"OneParentTwice", "\"parentsHashes\":[", "\"parentsHashes\":[\"<b>\",\"<b>\"",
            "'commits[0].parentsHashes' must not list a parent twice."},
        Row{"ThreeParents", "\"parentsHashes\":[", "\"parentsHashes\":[\"<b>\",\"<c>\",\"<d>\"",
            "'commits[0].parentsHashes' must not hold more than 2 parents."},
        Row{"OwnParent", "\"parentsHashes\":[", "\"parentsHashes\":[\"<a>\"",
            "'commits[0]' must not be its own parent."},
        Row{"NulInAuthor", "\"ann\"", "\"a\\u0000\"",
            "'commits[0].annotation.author' contains a NUL or an unpaired surrogate."},
        Row{"HalfACharacterInMessage", "moves", "\\uD83D",
            "'commits[0].annotation.message' contains a NUL or an unpaired surrogate."},
        Row{"DateWithoutZone", "09Z", "09", kDate}, Row{"DateWithFraction", "09Z", "09.5Z", kDate},
        Row{"MonthZero", "-03-", "-00-", kDate}, Row{"MonthThirteen", "-03-", "-13-", kDate},
        Row{"DayZero", "-05T", "-00T", kDate}, Row{"NoLeapDay", "2024-03-05", "2023-02-29", kDate},
        Row{"HourTwentyFour", "T14", "T24", kDate}, Row{"MinuteSixty", ":07:", ":60:", kDate},
        Row{"SecondSixty", ":09Z", ":60Z", kDate}, Row{"BlankInDate", "T14", " 14", kDate},
        Row{"SmallT", "T14", "t14", kDate}, Row{"SignInDate", "2024", "+024", kDate},
        Row{"NoKindOfContent", "po:<1>", "<1>", kUrl}, Row{"OtherKindOfContent", "po:<1>", "xx:<1>", kUrl},
        Row{"ContentInCapitals", "po:<1>", "PO:<1>", kUrl}, Row{"ShortContent", "po:<1>", "po:11", kUrl},
        Row{"LongContent", "po:<1>", "po:<1>1", kUrl}, Row{"StoreWithoutName", "po:<1>", "tf:#<1>", kUrl},
        Row{"StoreWithoutMark", "po:<1>", "tf:plan<1>", kUrl}, Row{"StoreWithoutHash", "po:<1>", "tf:plan#7", kUrl},
        Row{"StoreOutOfItsFolder", "po:<1>", "tf:../a#<1>", kUrl}, Row{"EmptyContent", "po:<1>", "", kUrl},
        Row{"UnsafePath", "\"plan.dwg\"", "\"../plan.dwg\"",
            "'commits[0].files[0].path' cannot be recorded. The path '../plan.dwg' has a part that consists of dots "
            "and spaces, which may lead out of the working folder."},
        Row{"EmptyPath", "\"plan.dwg\"", "\"\"", "'commits[0].files[0].path' cannot be recorded. The path is empty."},
        Row{"UnsafePreviousPath", "old.dwg", ".tav/tav.state",
            "'commits[0].files[1].previousPath' cannot be recorded. The path '.tav/tav.state' leads into the folder "
            "'.tav', which belongs to the repository."},
        Row{"OnePathTwice", "plan.dwg", "new.dwg", "'commits[0].files' must not hold the path 'new.dwg' twice."},
        Row{"FileThatIsAFolder", "plan.dwg", "new.dwg/a",
            "'commits[0].files' must not hold 'new.dwg' both as a file and as a folder."},
        Row{"UnknownRefType", "\"branch\"", "\"Branch\"", "'references[0].refType' must be 'branch' or 'tag'."},
        Row{"NoHashInReference", "\"commitHash\":\"<a>\"", "\"commitHash\":\"a\"",
            "'references[0].commitHash'" + kHash},
        Row{"OneNameTwice", "\"references\":[", R"("references":[{"commitHash":"<a>","name":"main","refType":"tag"},)",
            "'references' must not hold the name 'main' twice."}),
    support::rowName);

std::string named(std::string const& fault)
{
    return "'references[0].name' " + fault + ".";
}

INSTANTIATE_TEST_SUITE_P(
    ReferenceNames, ServerCommitRefusal,
    testing::Values(
        Row{"EmptyName", "\"main\"", "\"\"", named("is empty")},
        Row{"LongName", "main", std::string(256, 'x'), named("is longer than 255 bytes")},
        Row{"LineEndInName", "main", "a\\nb", named("holds a control character")},
        Row{"NulInName", "main", "a\\u0000", named("holds a control character")},
        Row{"HalfACharacterInName", "main", "\\uDE00", named("holds half a character")},
        Row{"BlankBeforeName", "main", " a", named("begins or ends with a blank")},
        Row{"BlankBehindName", "main", "a ", named("begins or ends with a blank")},
        Row{"DashBeforeName", "main", "-a", named("begins with a dash")},
        Row{"SlashBeforeName", "main", "/a", named("begins or ends with a slash")},
        Row{"SlashBehindName", "main", "a/", named("begins or ends with a slash")},
        Row{"DotsInName", "main", "a..b", named("holds two dots in a row")},
        Row{"NumberAsName", "\"main\"", "\"12\"", named("could be taken for the number of a commit")},
        Row{"HashAsName", "main", "<a>", named("could be taken for the hash of a commit")},
        Row{"HashInCapitalsAsName", "main", "<A>", named("could be taken for the hash of a commit")}),
    support::rowName);

class ServerCommitDate : public ServerCommit {
protected:
    std::string dateOf(std::string const& text)
    {
        send(replaced(commit('a', "", {}, {}), "2024-03-05T14:07:09Z", text));
        std::string const answer = everything();
        std::size_t const begin = answer.find("\"date\":") + 7;
        return answer.substr(begin, answer.find('.', begin) - begin);
    }
};

TEST_F(ServerCommitDate, BeginsWith1970)
{
    EXPECT_EQ(dateOf("1970-01-01T00:00:00Z"), "0");
}

TEST_F(ServerCommitDate, ReachesBackToTheYearZero)
{
    EXPECT_EQ(dateOf("0000-01-01T00:00:00Z"), "-62167219200");
}

TEST_F(ServerCommitDate, KnowsLeapDays)
{
    EXPECT_EQ(dateOf("2000-02-29T23:59:59Z"), "951868799");
}

TEST_F(ServerCommitDate, KnowsThatSomeCenturiesHaveNone)
{
    EXPECT_EQ(dateOf("2100-03-01T00:00:00Z"), "4107542400");
}

TEST_F(ServerCommitDate, ReachesTheYear9999)
{
    EXPECT_EQ(dateOf("9999-12-31T23:59:59Z"), "253402300799");
}

} // namespace
