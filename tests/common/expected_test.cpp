#include "common/mu_common_expected.h"
#include "common/mu_common_json.h"
#include "common/mu_common_repo_files.h"
#include "common/mu_common_versions.h"

#include <gmock/gmock.h>
#include <map>
#include <memory>
#include <string>
#include <type_traits>
#include <vector>

namespace {

using common::File;
using common::FileChange;
using common::StagedFile;
using common::VersionedFile;

std::string textOf(ErrorMessage const& error)
{
    return error.message.ansi_str();
}

ErrorMessage numbered(std::int32_t code)
{
    ErrorMessage error(L"disk full");
    error.code = code;
    return error;
}

TEST(ErrorMessage, HoldsATextWithoutArgumentsAsItStands)
{
    for (wchar_t const* text :
         {L"", L"disk full", L"%ls is not located in the current repository", L"100%", L"%s%n%d", L"%%"}) {
        EXPECT_EQ(ErrorMessage(text).message, OdString(text));
    }
}

TEST(ErrorMessage, FillsItsPlaceholdersInTheirOrder)
{
    EXPECT_EQ(textOf(ErrorMessage(L"Unable to find json key '%ls'", L"name")), "Unable to find json key 'name'");
    EXPECT_EQ(textOf(ErrorMessage(L"%ls, %ls", L"a", L"b")), "a, b");
    EXPECT_EQ(textOf(ErrorMessage(L"%ls, %ls, %ls", L"a", L"b", L"c")), "a, b, c");
}

TEST(ErrorMessage, HasCode0)
{
    EXPECT_EQ(ErrorMessage(L"disk full").code, 0);
    EXPECT_EQ(ErrorMessage(L"%ls", L"name").code, 0);
}

TEST(ErrorMessage, TakesPercentSignsOfAnArgumentForText)
{
    EXPECT_EQ(textOf(ErrorMessage(L"'%ls' '%ls'", L"%ls%n", L"%s%%")), "'%ls%n' '%s%%'");
}

TEST(ErrorMessage, HoldsArgumentsOutsideAscii)
{
    EXPECT_EQ(textOf(ErrorMessage(L"'%ls'", L"Pl\u00E4ne \u56FE \xDCFF")), "'Pl\u00E4ne \u56FE \xFF'");
}

TEST(ErrorMessage, HoldsArgumentsOfAnyLength)
{
    std::wstring const path(100'000, L'p');
    EXPECT_EQ(textOf(ErrorMessage(L"<%ls>", path.c_str())), "<" + std::string(100'000, 'p') + ">");
}

TEST(ErrorMessage, KeepsMessageAndCodeWhenItIsCopiedAndMoved)
{
    ErrorMessage const error = numbered(7);
    ErrorMessage copy(error);
    ErrorMessage const moved(std::move(copy));
    EXPECT_EQ(textOf(moved), "disk full");
    EXPECT_EQ(moved.code, 7);
    EXPECT_EQ(textOf(error), "disk full");
}

TEST(Expected, HoldsAnError)
{
    Expected<File> const result = ErrorMessage(L"disk full");
    EXPECT_FALSE(result.hasValue());
    EXPECT_EQ(textOf(result.error()), "disk full");
}

TEST(Expected, HoldsAValueThatCanOnlyBeMoved)
{
    auto owner = std::make_unique<int>(5);
    int const* const owned = owner.get();
    Expected<std::unique_ptr<int>> const result(std::move(owner));
    ASSERT_TRUE(result.hasValue());
    EXPECT_EQ(result.value().get(), owned);
}

TEST(Expected, HoldsACopyOfAValue)
{
    std::vector<int> const numbers = {1, 2};
    Expected<std::vector<int>> const result(numbers);
    EXPECT_EQ(result.value(), numbers);
}

TEST(Expected, HoldsTheDefaultValueWhenItIsBuiltInPlaceFromNothing)
{
    Expected<std::map<OdString, int>> const result(std::in_place);
    ASSERT_TRUE(result.hasValue());
    EXPECT_TRUE(result.value().empty());
}

TEST(Expected, BuildsAValueInPlaceThroughItsConstructor)
{
    OdString path = L"plan.dwg";
    FileChange const change = FileChange::removed;
    Expected<StagedFile> const result(std::in_place, std::move(path), change);
    EXPECT_EQ(result.value(), StagedFile(L"plan.dwg", FileChange::removed));
}

TEST(Expected, BuildsAnAggregateInPlace)
{
    Expected<VersionedFile> const result(std::in_place, OdString(L"plan.dwg"), OdString(L"tf:plan#1"));
    ASSERT_TRUE(result.hasValue());
    EXPECT_EQ(result.value().path, OdString(L"plan.dwg"));
    EXPECT_EQ(result.value().storagePath, OdString(L"tf:plan#1"));
}

TEST(Expected, IsCopiedIndependently)
{
    Expected<OdString> copy(OdString(L"first"));
    Expected<OdString> const original = copy;
    copy = numbered(7);
    EXPECT_EQ(original.value(), OdString(L"first"));
    EXPECT_EQ(copy.error().code, 7);
}

TEST(Expected, IsCopyableWhenItsValueIs)
{
    EXPECT_TRUE(std::is_copy_constructible_v<Expected<OdString>>);
    EXPECT_TRUE(std::is_copy_assignable_v<WriteOutcome>);
    EXPECT_FALSE(std::is_copy_constructible_v<Expected<std::unique_ptr<int>>>);
    EXPECT_TRUE(std::is_move_constructible_v<Expected<std::unique_ptr<int>>>);
}

TEST(Expected, PassesAnErrorOnToAnotherTypeWithItsCode)
{
    Expected<File> const first = numbered(7);
    Expected<std::vector<File>> const second = first.error();
    EXPECT_EQ(textOf(second.error()), "disk full");
    EXPECT_EQ(second.error().code, 7);
}

/// Says which alternative it was called with, and how.
struct Namer {
    std::string operator()(std::unique_ptr<int>&& value) const { return "value " + std::to_string(*value); }
    std::string operator()(std::unique_ptr<int> const&) const { return "a value that is not handed over"; }
    std::string operator()(ErrorMessage&& error) const { return "error " + textOf(error); }
    std::string operator()(ErrorMessage const&) const { return "an error that is not handed over"; }
};

TEST(Expected, HandsTheHeldAlternativeOverToAVisitor)
{
    Expected<std::unique_ptr<int>> value(std::make_unique<int>(5));
    Expected<std::unique_ptr<int>> error(ErrorMessage(L"disk full"));
    EXPECT_EQ(std::move(value).visit(Namer{}), "value 5");
    EXPECT_EQ(std::move(error).visit(Namer{}), "error disk full");
}

TEST(Expected, ReturnsTheVeryReferenceThatAVisitorReturns)
{
    int found = 0;
    struct ToReference {
        int& number;
        int& operator()(OdString&&) const { return number; }
        int& operator()(ErrorMessage&&) const { return number; }
    } const visitor{found};
    EXPECT_EQ(&Expected<OdString>(OdString(L"a")).visit(visitor), &found);
}

TEST(WriteOutcome, IsSuccessOrAnError)
{
    WriteOutcome const success(std::in_place);
    WriteOutcome const failure = ErrorMessage(L"disk full");
    EXPECT_TRUE(success.hasValue());
    EXPECT_EQ(textOf(failure.error()), "disk full");
}

/// Something to own that writes down when it goes.
struct Watched {
    explicit Watched(std::vector<std::string>& lifeLog) : log(lifeLog) {}
    Watched(Watched const&) = delete;
    Watched& operator=(Watched const&) = delete;
    ~Watched() { log.emplace_back("owned object gone"); }

    std::vector<std::string>& log;
};

struct Owner {
    Owner(std::vector<std::string>& log, std::unique_ptr<Watched> first, std::unique_ptr<Watched> second)
        : holds(std::string(first ? "first " : "") + (second ? "second" : ""))
    {
        log.emplace_back("value built");
    }

    std::string holds;
};

TEST(ExpectedInPlace, DeletesWhatItsArgumentsOwnBeforeItBuildsTheValue)
{
    std::vector<std::string> log;
    auto first = std::make_unique<Watched>(log);
    auto second = std::make_unique<Watched>(log);
    Expected<Owner> const result(std::in_place, log, std::move(first), std::move(second));
    EXPECT_EQ(result.value().holds, "");
    EXPECT_THAT(log, testing::ElementsAre("owned object gone", "owned object gone", "value built"));
}

TEST(ExpectedInPlace, LeavesTheFirstArgumentWhole)
{
    struct FirstOwner {
        FirstOwner(std::unique_ptr<int> first, std::unique_ptr<int> second)
            : hasFirst(first != nullptr)
            , hasSecond(second != nullptr)
        {
        }
        bool hasFirst;
        bool hasSecond;
    };
    Expected<FirstOwner> const result(std::in_place, std::make_unique<int>(1), std::make_unique<int>(2));
    EXPECT_TRUE(result.value().hasFirst);
    EXPECT_FALSE(result.value().hasSecond);
}

TEST(ExpectedInPlace, LeavesWhatCanBeCopiedWhole)
{
    OdString const kept = L"tf:plan#1";
    OdString given = L"plan.dwg";
    Expected<std::pair<OdString, OdString>> const moved(std::in_place, OdString(L"first"), std::move(given));
    EXPECT_EQ(moved.value().second, OdString(L"plan.dwg"));
    Expected<std::pair<OdString, OdString>> const copied(std::in_place, OdString(L"first"), kept);
    EXPECT_EQ(copied.value().second, kept);
    EXPECT_EQ(kept, OdString(L"tf:plan#1"));
}

TEST(ExpectedInPlace, KeepsWhatASharedPointerOwns)
{
    auto shared = std::make_shared<int>(5);
    Expected<std::pair<int, std::shared_ptr<int>>> const result(std::in_place, 1, std::move(shared));
    ASSERT_NE(result.value().second, nullptr);
    EXPECT_EQ(result.value().second.use_count(), 1);
}

struct WatchedInfo : common::MetaInfo {
    explicit WatchedInfo(std::vector<std::string>& lifeLog) : watched(lifeLog) {}
    Watched watched;
};

TEST(ExpectedInPlace, BuildsTheVersionsOfAReceivedFileWithoutTheirOwners)
{
    using Received = common::Versions<VersionedFile, std::shared_ptr<File>>;
    std::vector<std::string> log;
    auto previous = std::make_unique<File>(File{L"old.dwg"});
    auto info = std::make_unique<WatchedInfo>(log);
    Expected<Received> const result(
        std::in_place, VersionedFile{L"plan.dwg", L"tf:plan#1"}, std::move(previous), std::move(info));
    ASSERT_TRUE(result.hasValue());
    EXPECT_EQ(result.value().current.path, OdString(L"plan.dwg"));
    EXPECT_EQ(result.value().current.storagePath, OdString(L"tf:plan#1"));
    EXPECT_EQ(result.value().previous, nullptr);
    EXPECT_EQ(result.value().metaInfo, nullptr);
    EXPECT_THAT(log, testing::ElementsAre("owned object gone"));
}

TEST(ExpectedThatGoes, GivesAValueThatMayBeWalkedAtOnce)
{
    auto const collect = [] { return Expected<std::vector<std::string>>({"a long name of a drawing.dwg", "b.dwg"}); };
    std::string walked;
    for (std::string& name : collect().value()) {
        walked += name;
    }
    EXPECT_EQ(walked, "a long name of a drawing.dwgb.dwg");
    EXPECT_TRUE((std::is_same_v<decltype(collect().value()), std::vector<std::string>>));
}

TEST(ExpectedThatGoes, GivesAValueThatCanOnlyBeMoved)
{
    Expected<std::unique_ptr<int>> result(std::make_unique<int>(5));
    EXPECT_EQ(*std::move(result).value(), 5);
}

TEST(ExpectedThatGoes, GivesAMessageThatMayBeKept)
{
    auto const fail = [] { return Expected<int>(ErrorMessage(L"the disk is full")); };
    ErrorMessage const& kept = fail().error();
    EXPECT_EQ(kept.message, OdString(L"the disk is full"));
    EXPECT_TRUE((std::is_same_v<decltype(fail().error()), ErrorMessage>));
}

TEST(GetRValueOrThrow, GivesTheVeryValue)
{
    Expected<OdString> result(OdString(L"plan.dwg"));
    OdString const* const held = &result.value();
    OdString&& given = std::move(result).visit(GetRValueOrThrow<OdString>{});
    EXPECT_EQ(&given, held);
    EXPECT_EQ(given, OdString(L"plan.dwg"));
}

TEST(GetRValueOrThrow, GivesAValueThatCanOnlyBeMoved)
{
    Expected<std::unique_ptr<int>> result(std::make_unique<int>(5));
    std::unique_ptr<int> const taken = std::move(result).visit(GetRValueOrThrow<std::unique_ptr<int>>{});
    EXPECT_EQ(*taken, 5);
}

TEST(GetRValueOrThrow, ThrowsOneSentenceWhateverTheErrorSaid)
{
    for (wchar_t const* reason : {L"", L"disk full", L"%ls"}) {
        try {
            OdString const value = Expected<OdString>(ErrorMessage(reason)).visit(GetRValueOrThrow<OdString>{});
            FAIL() << "nothing was thrown, but given: " << value.ansi_str();
        } catch (OdError const& error) {
            EXPECT_EQ(
                error.description(),
                OdString(L"Attempting to get the value of an Expected type that contains an error."));
        }
    }
}

TEST(GetRValueOrThrow, HasNoState)
{
    EXPECT_TRUE(std::is_empty_v<GetRValueOrThrow<File>>);
}

TEST(JsonParseError, IsCaughtAsOdError)
{
    try {
        throw common::JsonParseError(L"Unable to find json key 'name'");
    } catch (OdError const& error) {
        EXPECT_EQ(error.description(), OdString(L"Unable to find json key 'name'"));
        EXPECT_STREQ(error.what(), "Unable to find json key 'name'");
    }
}

TEST(JsonParseError, IsMadeFromAMessageOnly)
{
    EXPECT_TRUE((std::is_constructible_v<common::JsonParseError, OdString const&>));
    EXPECT_FALSE((std::is_constructible_v<common::JsonParseError, OdResult>));
    EXPECT_FALSE(std::is_default_constructible_v<common::JsonParseError>);
}

} // namespace
