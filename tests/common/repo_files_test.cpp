#include "common/mu_common_repo_files.h"
#include "common/mu_common_versions.h"

#include "platform/os/os_calls.h"
#include "tests/support/as_ordinary_user.h"
#include "tests/support/failing_call.h"
#include "tests/support/foreign_locale.h"
#include "tests/support/rows.h"
#include "tests/support/temp_repository.h"

#include <cerrno>
#include <csignal>
#include <cstdlib>
#include <ctime>
#include <fcntl.h>
#include <fstream>
#include <gmock/gmock.h>
#include <limits>
#include <string>
#include <sys/resource.h>
#include <sys/stat.h>
#include <type_traits>
#include <unistd.h>
#include <utility>

#include <QTextCodec>

namespace {

using common::BaseFile;
using common::ConflictInfo;
using common::File;
using common::FileChange;
using common::isDifferent;
using common::logString;
using common::MetaInfo;
using common::PossibleRepoFile;
using common::RepoFile;
using common::StagedFile;
using common::VersionedFile;
using common::Versions;
using support::TempRepository;
using testing::ElementsAre;
using testing::MatchesRegex;

struct Change {
    FileChange change;
    std::int32_t number;
    wchar_t const* text;
};

constexpr Change kChanges[] = {
    {FileChange::added, 0, L"added"},
    {FileChange::modified, 1, L"modified"},
    {FileChange::removed, 2, L"removed"},
};

TEST(FileChange, HasItsNumbers)
{
    EXPECT_TRUE((std::is_same_v<std::underlying_type_t<FileChange>, std::int32_t>));
    for (Change const& row : kChanges) {
        EXPECT_EQ(static_cast<std::int32_t>(row.change), row.number);
    }
}

TEST(FileChange, HasItsTexts)
{
    for (Change const& row : kChanges) {
        EXPECT_EQ(common::toString(row.change).value(), OdString(row.text));
        EXPECT_EQ(common::toFileChange(row.text).value(), row.change);
    }
}

TEST(FileChange, HasNoTextBeyondItsNumbers)
{
    for (int const number : {3, -1, std::numeric_limits<std::int32_t>::max()}) {
        Expected<OdString> const text = common::toString(static_cast<FileChange>(number));
        ASSERT_FALSE(text.hasValue()) << number;
        EXPECT_EQ(text.error().message.ansi_str(), "unsupported file change");
        EXPECT_EQ(text.error().code, 0);
    }
}

TEST(FileChange, IsNotReadFromOtherTexts)
{
    for (char const* text :
         {"Modified", "ADDED", "", "remove", "removed ", " added", "0", "%s%n%ls", "ge\u00E4ndert"}) {
        Expected<FileChange> const change = common::toFileChange(OdString(text, CP_UTF_8));
        ASSERT_FALSE(change.hasValue()) << text;
        EXPECT_EQ(change.error().message.ansi_str(), std::string("Unsupported file change enum: ") + text);
        EXPECT_EQ(change.error().code, 0);
    }
}

TEST(FileChange, IsNotReadFromATextThatOnlyBeginsWithOne)
{
    EXPECT_FALSE(common::toFileChange(OdString(L"added\0", 6)).hasValue());
}

TEST(StagedFile, HoldsPathAndChange)
{
    StagedFile const staged(L"sub/plan.dwg", FileChange::removed);
    EXPECT_EQ(staged.path, OdString(L"sub/plan.dwg"));
    EXPECT_EQ(staged.change, FileChange::removed);
}

TEST(StagedFile, EqualsOneOfTheSamePathAndChange)
{
    StagedFile const staged(L"plan.dwg", FileChange::added);
    EXPECT_TRUE(staged == StagedFile(L"plan.dwg", FileChange::added));
    EXPECT_FALSE(staged == StagedFile(L"plan.dwg", FileChange::modified));
    EXPECT_FALSE(staged == StagedFile(L"Plan.dwg", FileChange::added));
    EXPECT_FALSE(staged == StagedFile(L"./plan.dwg", FileChange::added));
}

TEST(RepoFile, HasNoBaseUnlessItIsGivenOne)
{
    RepoFile const plain(L"plan.dwg", L"tf:plan#1");
    EXPECT_EQ(plain.path, OdString(L"plan.dwg"));
    EXPECT_EQ(plain.storagePath, OdString(L"tf:plan#1"));
    EXPECT_EQ(plain.base, nullptr);
    EXPECT_EQ(RepoFile(L"plan.dwg", L"tf:plan#1", nullptr).base, nullptr);
}

TEST(RepoFile, TakesItsBaseOver)
{
    auto base = std::make_unique<RepoFile>(L"old.dwg", L"tf:plan#0");
    BaseFile const* const given = base.get();
    RepoFile const file(L"plan.dwg", L"tf:plan#1", std::move(base));
    EXPECT_EQ(file.base.get(), given);
    EXPECT_EQ(file.base->path, OdString(L"old.dwg"));
    EXPECT_EQ(file.storagePath, OdString(L"tf:plan#1"));
}

TEST(RepoFile, IsDestroyedThroughItsBase)
{
    EXPECT_TRUE(std::has_virtual_destructor_v<BaseFile>);
    EXPECT_TRUE((std::is_base_of_v<BaseFile, RepoFile>));
}

struct Candidate {
    char const* name;
    PossibleRepoFile file;
    boost::optional<OdString> storagePath;
    boost::optional<OdString> previousPath;
};

void PrintTo(Candidate const& row, std::ostream* out)
{
    *out << row.name;
}

class PossibleRepoFiles : public testing::TestWithParam<Candidate> {};

TEST_P(PossibleRepoFiles, HoldWhatTheyAreGiven)
{
    EXPECT_EQ(GetParam().file.path, OdString(L"plan.dwg"));
    EXPECT_TRUE(GetParam().file.storagePath == GetParam().storagePath);
    EXPECT_TRUE(GetParam().file.previousPath == GetParam().previousPath);
}

OdString const kPlan = L"plan.dwg";
OdString const kUrl = L"tf:plan#1";
OdString const kOld = L"old.dwg";
boost::optional<OdString> const kKnownUrl = OdString(L"tf:plan#1");
boost::optional<OdString> const kUnknown;

INSTANTIATE_TEST_SUITE_P(
    Constructors, PossibleRepoFiles,
    testing::Values(
        Candidate{"Path", PossibleRepoFile(kPlan), kUnknown, kUnknown},
        Candidate{"PathAndStorage", PossibleRepoFile(kPlan, kUrl), kUrl, kUnknown},
        Candidate{"PathStorageAndPrevious", PossibleRepoFile(kPlan, kUrl, kOld), kUrl, kOld},
        Candidate{"PathAndKnownStorage", PossibleRepoFile(kPlan, kKnownUrl), kUrl, kUnknown},
        Candidate{"PathAndUnknownStorage", PossibleRepoFile(kPlan, kUnknown), kUnknown, kUnknown},
        Candidate{"PathKnownStorageAndPrevious", PossibleRepoFile(kPlan, kKnownUrl, kOld), kUrl, kOld},
        Candidate{"PathUnknownStorageAndPrevious", PossibleRepoFile(kPlan, kUnknown, kOld), kUnknown, kOld},
        Candidate{"EmptyTextsAreSet", PossibleRepoFile(kPlan, OdString(), OdString()), OdString(), OdString()}),
    support::rowName);

TEST(Versions, OfTheWorkingFolderAreAggregatesInTheirOrder)
{
    auto const info = std::make_shared<MetaInfo>();
    Versions<File, VersionedFile> const modified{info, {L"plan.dwg"}, {L"old.dwg", L"tf:plan#1"}, 5};
    EXPECT_EQ(modified.metaInfo, info);
    EXPECT_EQ(modified.working.path, OdString(L"plan.dwg"));
    EXPECT_EQ(modified.committed.path, OdString(L"old.dwg"));
    EXPECT_EQ(modified.committed.storagePath, OdString(L"tf:plan#1"));
    EXPECT_EQ(modified.hostValue, 5);
    Versions<File, void> const added{nullptr, {L"plan.dwg"}, -5};
    EXPECT_EQ(added.metaInfo, nullptr);
    EXPECT_EQ(added.working.path, OdString(L"plan.dwg"));
    EXPECT_EQ(added.hostValue, -5);
    Versions<void, VersionedFile> const removed{info, {L"plan.dwg", L"tf:plan#1"}, 6};
    EXPECT_EQ(removed.committed.path, OdString(L"plan.dwg"));
    EXPECT_EQ(removed.hostValue, 6);
    EXPECT_TRUE((std::is_same_v<decltype(modified.hostValue), std::int32_t>));
}

TEST(Versions, OfTheWorkingFolderCarryNothingByThemselves)
{
    Versions<File, VersionedFile> const versions{};
    EXPECT_EQ(versions.metaInfo, nullptr);
    EXPECT_EQ(versions.hostValue, 0);
}

TEST(Versions, ShareTheirInformationWithACopy)
{
    Versions<File, VersionedFile> versions{std::make_shared<MetaInfo>(), {L"plan.dwg"}, {L"plan.dwg", L"tf:plan#1"}, 5};
    Versions<File, VersionedFile> const copy = versions;
    EXPECT_EQ(copy.metaInfo, versions.metaInfo);
    EXPECT_EQ(copy.metaInfo.use_count(), 2);
    versions.working.path = L"new.dwg";
    versions.hostValue = 6;
    EXPECT_EQ(copy.working.path, OdString(L"plan.dwg"));
    EXPECT_EQ(copy.hostValue, 5);
}

using Received = Versions<VersionedFile, std::shared_ptr<File>>;

TEST(Versions, OfAReceivedFileTakeTheirOwnersOver)
{
    auto previous = std::make_unique<File>(File{L"old.dwg"});
    auto info = std::make_unique<ConflictInfo>(L"plan.dwg", L"", L"");
    File const* const givenFile = previous.get();
    MetaInfo const* const givenInfo = info.get();
    Received const received(VersionedFile{L"plan.dwg", L"tf:plan#1"}, std::move(previous), std::move(info));
    EXPECT_EQ(received.current.path, OdString(L"plan.dwg"));
    EXPECT_EQ(received.current.storagePath, OdString(L"tf:plan#1"));
    EXPECT_EQ(received.previous.get(), givenFile);
    EXPECT_EQ(received.metaInfo.get(), givenInfo);
}

TEST(Versions, OfAReceivedFileShareTheirPointersWithACopy)
{
    Received const received(
        VersionedFile{L"plan.dwg", L""}, std::make_unique<File>(File{L"old.dwg"}), std::make_unique<MetaInfo>());
    Received const copy = received;
    EXPECT_EQ(copy.previous, received.previous);
    EXPECT_EQ(copy.metaInfo, received.metaInfo);
    EXPECT_EQ(received.previous.use_count(), 2);
}

TEST(Versions, OfAReceivedFileAloneHaveNothingElse)
{
    Received const received(VersionedFile{L"plan.dwg", L"tf:plan#1"});
    EXPECT_EQ(received.previous, nullptr);
    EXPECT_EQ(received.metaInfo, nullptr);
}

/// A line of the log: a time such as "Tue Mar  5 14:07:09 2024", then the text.
std::string lineWith(std::string const& text)
{
    return "[A-Z][a-z][a-z] [A-Z][a-z][a-z] [ 1-3][0-9] [0-2][0-9]:[0-5][0-9]:[0-6][0-9] 20[0-9][0-9] - " + text + "\n";
}

constexpr std::size_t kTimeLength = 24;
constexpr char const* kLog = ".tav/tav.log";

/// What follows the time in the first line of the log.
std::string loggedBehindTheTime(TempRepository const& repository)
{
    return repository.read(kLog).substr(kTimeLength);
}

TEST(LogString, CreatesTheLogWithALine)
{
    TempRepository const repository;
    EXPECT_TRUE(logString(L"opened", repository.root()));
    EXPECT_THAT(repository.read(kLog), MatchesRegex(lineWith("opened")));
    EXPECT_THAT(repository.list(), ElementsAre(".tav/", kLog));
}

TEST(LogString, AppendsToTheLog)
{
    TempRepository const repository;
    repository.write(kLog, "an old line without an end");
    EXPECT_TRUE(logString(L"first", repository.root()));
    EXPECT_TRUE(logString(L"second", repository.root()));
    EXPECT_THAT(
        repository.read(kLog), MatchesRegex("an old line without an end" + lineWith("first") + lineWith("second")));
}

TEST(LogString, WritesTheLocalTime)
{
    TempRepository const repository;
    ASSERT_EQ(setenv("TZ", "TEST-5:30", 1), 0);
    tzset();
    std::time_t const before = std::time(nullptr);
    EXPECT_TRUE(logString(L"opened", repository.root()));
    std::time_t const after = std::time(nullptr);
    unsetenv("TZ");
    tzset();
    std::tm time{};
    ASSERT_NE(strptime(repository.read(kLog).c_str(), "%a %b %e %H:%M:%S %Y", &time), nullptr);
    constexpr std::time_t kAhead = 5 * 3600 + 30 * 60;
    EXPECT_GE(timegm(&time), before + kAhead);
    EXPECT_LE(timegm(&time), after + kAhead);
}

TEST(LogString, WritesTheTextAsItStands)
{
    for (char const* text :
         {"", " ", "%s%n%ls", "two\nlines", "a\ttab\r", "\u00E4 \u56FE \U0001F600", "\uFEFFmarked"}) {
        TempRepository const repository;
        EXPECT_TRUE(logString(OdString(text, CP_UTF_8), repository.root()));
        EXPECT_EQ(loggedBehindTheTime(repository), std::string(" - ") + text + "\n");
    }
}

TEST(LogString, WritesANulAsItStands)
{
    TempRepository const repository;
    EXPECT_TRUE(logString(OdString(L"a\0b", 3), repository.root()));
    EXPECT_EQ(loggedBehindTheTime(repository), std::string(" - a\0b\n", 7));
}

TEST(LogString, WritesALongText)
{
    TempRepository const repository;
    std::string const text(100'000, 'p');
    EXPECT_TRUE(logString(OdString(text.c_str(), CP_UTF_8), repository.root()));
    EXPECT_EQ(loggedBehindTheTime(repository), " - " + text + "\n");
}

// Text in the log is UTF-8, which has no form for a byte that is not: one sign stands in for each.
TEST(LogString, WritesASignForEachByteThatIsNotUtf8)
{
    TempRepository const repository;
    EXPECT_TRUE(logString(OdString("pl\xE4n \xFF.dwg", CP_UTF_8), repository.root()));
    EXPECT_EQ(loggedBehindTheTime(repository), " - pl?n ?.dwg\n");
}

TEST(LogString, FindsARepositoryWhoseNameIsNotUtf8)
{
    support::TempFolder const folder;
    folder.makeFolder("Pl\xE4ne \u56FE %s%n/.tav");
    EXPECT_TRUE(logString(L"opened", common::RootPath(folder.widePathTo("Pl\xE4ne \u56FE %s%n"))));
    EXPECT_THAT(folder.read("Pl\xE4ne \u56FE %s%n/.tav/tav.log"), MatchesRegex(lineWith("opened")));
}

TEST(LogString, WritesTheSameUnderEveryLocale)
{
    for (char const* name : {"C", "C.UTF-8"}) {
        support::TempFolder const folder;
        folder.makeFolder("Pl\xE4ne \u56FE/.tav");
        {
            support::ForeignLocale const locale(name);
            EXPECT_TRUE(logString(L"\u00E4 \u56FE 1234567", common::RootPath(folder.widePathTo("Pl\xE4ne \u56FE"))));
        }
        EXPECT_THAT(folder.read("Pl\xE4ne \u56FE/.tav/tav.log"), MatchesRegex(lineWith("\u00E4 \u56FE 1234567")))
            << name;
    }
}

/// While it lives, Qt takes narrow texts for Latin-1 unless it is told otherwise.
class Latin1InQt {
public:
    Latin1InQt() { QTextCodec::setCodecForLocale(QTextCodec::codecForName("ISO-8859-1")); }
    Latin1InQt(Latin1InQt const&) = delete;
    Latin1InQt& operator=(Latin1InQt const&) = delete;
    ~Latin1InQt() { QTextCodec::setCodecForLocale(nullptr); }
};

TEST(LogString, WritesUtf8WhateverTheHostHasSetForQt)
{
    TempRepository const repository;
    Latin1InQt const latin1;
    EXPECT_TRUE(logString(L"\u00E4 \u56FE", repository.root()));
    EXPECT_EQ(loggedBehindTheTime(repository), " - \u00E4 \u56FE\n");
}

TEST(LogString, FailsWithoutARepository)
{
    support::TempFolder const folder;
    EXPECT_FALSE(logString(L"opened", common::RootPath(folder.widePath())));
    EXPECT_THAT(folder.list(), testing::IsEmpty());
}

TEST(LogString, FailsWhereTheLogCannotBeOpened)
{
    TempRepository const repository;
    repository.makeFolder(kLog);
    EXPECT_FALSE(logString(L"opened", repository.root()));
}

TEST(LogString, DoesNotWriteIntoTheFileThatAPathNamesUpToANul)
{
    TempRepository const repository;
    repository.write("plan.dwg", "a drawing");
    EXPECT_FALSE(logString(L"opened", common::RootPath(repository.widePathTo("plan.dwg") + L'\0' + L"more")));
    EXPECT_EQ(repository.read("plan.dwg"), "a drawing");
}

TEST(LogString, FailsWhereNothingMayBeWritten)
{
    TempRepository const repository;
    repository.write(kLog, "old\n");
    ASSERT_EQ(chmod(repository.path().c_str(), 0755), 0);
    ASSERT_EQ(chmod(repository.pathTo(kLog).c_str(), 0444), 0);
    EXPECT_EQ(
        support::asOrdinaryUser([&] { return logString(L"opened", repository.root()) ? "logged" : "refused"; }),
        "refused");
    EXPECT_EQ(repository.read(kLog), "old\n");
}

TEST(LogString, TakesNoNoticeOfADiskThatIsFull)
{
    TempRepository const repository;
    std::string const answer = support::inOwnProcess([&] {
        rlimit const none{0, 0};
        setrlimit(RLIMIT_FSIZE, &none);
        signal(SIGXFSZ, SIG_IGN);
        return logString(OdString(std::wstring(100'000, L'x').c_str()), repository.root()) ? "logged" : "refused";
    });
    EXPECT_EQ(answer, "logged");
    EXPECT_EQ(repository.read(kLog), "");
}

// Opening a pipe waits until somebody reads from it.
TEST(LogString, FailsAtOnceWhereAPipeHasThePlaceOfTheLog)
{
    TempRepository const repository;
    ASSERT_EQ(mkfifo(repository.pathTo(kLog).c_str(), 0600), 0);
    EXPECT_FALSE(logString(L"opened", repository.root()));
    int const reader = open(repository.pathTo(kLog).c_str(), O_RDONLY | O_NONBLOCK | O_CLOEXEC);
    ASSERT_GE(reader, 0);
    EXPECT_FALSE(logString(L"opened", repository.root()));
    char byte = 0;
    EXPECT_EQ(read(reader, &byte, 1), 0);
    close(reader);
}

TEST(LogString, FailsWhereALinkLeadsToADevice)
{
    TempRepository const repository;
    repository.makeLink(kLog, "/dev/null");
    EXPECT_FALSE(logString(L"opened", repository.root()));
}

TEST(LogString, FollowsALinkToAFile)
{
    TempRepository const repository;
    repository.write("elsewhere.log", "old\n");
    repository.makeLink(kLog, repository.pathTo("elsewhere.log"));
    EXPECT_TRUE(logString(L"opened", repository.root()));
    EXPECT_THAT(repository.read("elsewhere.log"), testing::EndsWith(" - opened\n"));
}

TEST(LogString, FailsWhereTheProcessMayOpenNoMoreFiles)
{
    TempRepository const repository;
    repository.write(kLog, "old\n");
    ASSERT_EQ(chmod(repository.path().c_str(), 0777), 0);
    ASSERT_EQ(chmod(repository.pathTo(kLog).c_str(), 0666), 0);
    std::string const answer = support::asOrdinaryUser([&] {
        rlimit const none{0, 0};
        setrlimit(RLIMIT_NOFILE, &none);
        return logString(L"opened", repository.root()) ? "logged" : "refused";
    });
    EXPECT_EQ(answer, "refused");
    EXPECT_EQ(repository.read(kLog), "old\n");
}

constexpr char const* kOfNoBytes = "e3b0c44298fc1c149afbf4c8996fb92427ae41e4649b934ca495991b7852b855";
constexpr char const* kOfAbc = "ba7816bf8f01cfea414140de5dae2223b00361a396177a9cb410ff61f20015ad";
constexpr char const* kOfThreeNuls = "709e80c88487a2411e1ee4dfb9f22a861492d20c4765150c0c794abd70f8147c";

OdString recorded(std::string const& prefix, std::string const& digest)
{
    return OdString((prefix + digest).c_str(), CP_UTF_8);
}

struct Recorded {
    char const* name;
    std::string content;
    std::string hash;
    bool differs;
};

void PrintTo(Recorded const& row, std::ostream* out)
{
    *out << row.name;
}

class IsDifferent : public testing::TestWithParam<Recorded> {};

TEST_P(IsDifferent, ComparesTheContentWithTheRecordedHash)
{
    TempRepository const repository;
    repository.write("sub/plan.dwg", GetParam().content);
    EXPECT_EQ(isDifferent(L"sub/plan.dwg", recorded("", GetParam().hash), repository.root()), GetParam().differs);
}

std::string const kPiece(1 << 18, 'p');

INSTANTIATE_TEST_SUITE_P(
    Hashes, IsDifferent,
    testing::Values(
        Recorded{"Same", "abc", std::string("sh:") + kOfAbc, false},
        Recorded{"OfAnEmptyFile", "", std::string("sh:") + kOfNoBytes, false},
        Recorded{"Another", "abd", std::string("sh:") + kOfAbc, true},
        Recorded{"AnyThreeCharactersBefore", "abc", std::string("\u56FE T") + kOfAbc, false},
        Recorded{"FourCharactersBefore", "abc", std::string("sha:") + kOfAbc, true},
        Recorded{"NothingBefore", "abc", kOfAbc, true}, Recorded{"StorageMarker", "abc", "tf:plan#1", true},
        Recorded{"StorageMarkerBeforeTheDigest", "abc", std::string("tf:") + kOfAbc, true},
        Recorded{"StorageMarkerWithoutColonBeforeTheDigest", "abc", std::string("tf#") + kOfAbc, true},
        Recorded{"StorageMarkerAlone", "abc", "tf", true},
        Recorded{"StorageMarkerInOtherCase", "abc", std::string("TF:") + kOfAbc, false},
        Recorded{"HalfAStorageMarker", "abc", std::string("t::") + kOfAbc, false},
        Recorded{"UpperCase", "abc", "sh:BA7816BF8F01CFEA414140DE5DAE2223B00361A396177A9CB410FF61F20015AD", true},
        Recorded{"MoreBehind", "abc", std::string("sh:") + kOfAbc + " ", true}, Recorded{"Empty", "abc", "", true},
        Recorded{"EmptyForAnEmptyFile", "", "", true}, Recorded{"TooShort", "", "sh", true},
        Recorded{"OnlyThePrefix", "", "sh:", true},
        Recorded{
            "LineEndsCount", "abc\r\n", "sh:552bab6864c7a7b69a502ed1854b9245c0e1a30f008aaa0b281da62585fdb025", false},
        Recorded{
            "ByteOrderMarkCounts", "\uFEFF", "sh:f1945cd6c19e56b3c1c78943ef5ec18116907a4ca1efc40a57d48ab1db7adfc5",
            false},
        Recorded{"Nuls", std::string(3, '\0'), std::string("sh:") + kOfThreeNuls, false},
        Recorded{
            "OnePieceLessOne", kPiece.substr(1), "sh:ec6374440543e6484eb67be17e3cada65445d04a2d91dd59a1b31db7bfcf2b29",
            false},
        Recorded{"OnePiece", kPiece, "sh:d5874a6421541f808a125ad78030f7ca1df4c2fc64184fcc8528cbcb40860f2d", false},
        Recorded{
            "OnePieceAndOne", kPiece + "p", "sh:6ce3ebb206aa5b10e152e782f384927ad33a078285f08ecf365103bc2a9dbde4",
            false},
        Recorded{
            "SeveralPieces", kPiece + kPiece + kPiece + "p",
            "sh:5347148dcbbacc35d33d1da1ad47e99565be3a9804ed22011a1779ed759737c9", false},
        Recorded{
            "LastByteOfSeveralPieces", kPiece + kPiece + kPiece + "q",
            "sh:5347148dcbbacc35d33d1da1ad47e99565be3a9804ed22011a1779ed759737c9", true}),
    support::rowName);

TEST(IsDifferentFrom, AStorageReferenceWithoutALookAtTheDisk)
{
    TempRepository const repository;
    repository.write("plan.dwg", "abc");
    EXPECT_EQ(support::countCalls([&] { EXPECT_TRUE(isDifferent(L"plan.dwg", L"tf:plan#1", repository.root())); }), 0);
    EXPECT_TRUE(isDifferent(L"missing.dwg", L"tf:plan#1", repository.root()));
}

TEST(IsDifferentFrom, NoBytesWhenTheFileCannotBeOpened)
{
    TempRepository const repository;
    repository.makeFolder("folder");
    repository.makeLink("dangling", "nowhere");
    for (wchar_t const* name : {L"missing.dwg", L"folder", L"dangling", L""}) {
        EXPECT_FALSE(isDifferent(name, recorded("sh:", kOfNoBytes), repository.root())) << OdString(name).ansi_str();
        EXPECT_TRUE(isDifferent(name, recorded("sh:", kOfAbc), repository.root())) << OdString(name).ansi_str();
    }
}

TEST(IsDifferentFrom, NoBytesWhenTheFileMayNotBeRead)
{
    TempRepository const repository;
    repository.write("plan.dwg", "abc");
    ASSERT_EQ(chmod(repository.path().c_str(), 0755), 0);
    ASSERT_EQ(chmod(repository.pathTo("plan.dwg").c_str(), 0), 0);
    EXPECT_EQ(
        support::asOrdinaryUser([&] {
            return isDifferent(L"plan.dwg", recorded("sh:", kOfNoBytes), repository.root()) ? "different" : "the same";
        }),
        "the same");
}

TEST(IsDifferentFrom, ZerosInPlaceOfBytesThatCannotBeRead)
{
    TempRepository const repository;
    repository.write("plan.dwg", "abc");
    support::FailingCall const failing(1, EIO);
    EXPECT_FALSE(isDifferent(L"plan.dwg", recorded("sh:", kOfThreeNuls), repository.root()));
    EXPECT_EQ(failing.name(), "1: read");
}

/// The hash of `content` as a commit records it.
OdString hashOf(std::string const& content)
{
    return recorded("sh:", generateSha(content.data(), static_cast<int>(content.size())).ansi_str());
}

TEST(IsDifferentFrom, ZerosFromThePieceOnThatCannotBeRead)
{
    TempRepository const repository;
    repository.write("plan.dwg", kPiece + std::string(kPiece.size(), 'q') + "rest");
    std::string const zeros(kPiece.size() + 4, '\0');
    support::FailingCall const failing(2, EIO);
    EXPECT_FALSE(isDifferent(L"plan.dwg", hashOf(kPiece + zeros), repository.root()));
    EXPECT_EQ(failing.name(), "2: read");
}

/// While it lives, the file `path` is cut off behind `length` bytes before its second piece is read.
class CutOffWhileRead {
public:
    CutOffWhileRead(std::string path, std::size_t length)
    {
        s_path = std::move(path);
        s_length = static_cast<off_t>(length);
        s_reads = 0;
        os::calls().read = cutAndRead;
    }
    CutOffWhileRead(CutOffWhileRead const&) = delete;
    CutOffWhileRead& operator=(CutOffWhileRead const&) = delete;
    ~CutOffWhileRead() { os::calls().read = ::read; }

private:
    static ssize_t cutAndRead(int file, void* buffer, std::size_t count)
    {
        if (++s_reads == 2) {
            EXPECT_EQ(truncate(s_path.c_str(), s_length), 0);
        }
        return ::read(file, buffer, count);
    }

    static inline std::string s_path;
    static inline off_t s_length = 0;
    static inline int s_reads = 0;
};

TEST(IsDifferentFrom, ZerosInPlaceOfWhatTheFileLosesWhileItIsRead)
{
    TempRepository const repository;
    repository.write("plan.dwg", kPiece + std::string(1000, 'q'));
    CutOffWhileRead const cutOff(repository.pathTo("plan.dwg"), kPiece.size() + 5);
    EXPECT_FALSE(isDifferent(L"plan.dwg", hashOf(kPiece + "qqqqq" + std::string(995, '\0')), repository.root()));
}

TEST(IsDifferentFrom, AFileWhoseNameIsNotUtf8)
{
    TempRepository const repository;
    repository.write("Pl\xE4ne/\u56FE %s%n.dwg", "abc");
    OdString const path("Pl\xE4ne/\u56FE %s%n.dwg", CP_UTF_8);
    EXPECT_FALSE(isDifferent(path, recorded("sh:", kOfAbc), repository.root()));
    EXPECT_TRUE(isDifferent(path, recorded("sh:", kOfNoBytes), repository.root()));
}

TEST(IsDifferentFrom, TheSameFileUnderEveryLocale)
{
    TempRepository const repository;
    repository.write("plan.dwg", "abc");
    for (char const* name : {"C", "C.UTF-8"}) {
        support::ForeignLocale const locale(name);
        EXPECT_FALSE(isDifferent(L"plan.dwg", recorded("sh:", kOfAbc), repository.root())) << name;
    }
}

long peakMemory()
{
    rusage usage{};
    getrusage(RUSAGE_SELF, &usage);
    return usage.ru_maxrss; // in KiB
}

// In a child process, whose peak begins at what it holds.
TEST(IsDifferentFrom, AFileOfMoreThan2GibWithoutHoldingIt)
{
    constexpr std::streamoff k2Gib = 1LL << 31;
    TempRepository const repository;
    std::ofstream file(repository.pathTo("plan.dwg"), std::ios::binary);
    file.seekp(k2Gib).write("tail.", 5);
    file.close();
    ASSERT_EQ(chmod(repository.path().c_str(), 0755), 0);
    EXPECT_EQ(
        support::asOrdinaryUser([&] {
            long const before = peakMemory();
            bool const different = isDifferent(
                L"plan.dwg", L"sh:6f0400d819fcd0c24b54f95de83fa263e0b54ccbe3f247ce2aba6d9cfe639cf9", repository.root());
            long const growth = peakMemory() - before;
            return std::string(different ? "different" : "the same") +
                   (growth < 8 * 1024 ? "" : ", grown by " + std::to_string(growth) + " KiB");
        }),
        "the same");
}

} // namespace
