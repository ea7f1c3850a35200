#include "common/mu_common_versions.h"
#include "tests/support/rows.h"

#include <gmock/gmock.h>
#include <string>
#include <type_traits>
#include <utility>

namespace {

using common::ConflictInfo;
using common::ContentDigest;
using common::FileChange;
using common::MetaInfo;
using common::StatusImp;
using common::StatusRef;

struct Digest {
    char const* name;
    std::string bytes;
    char const* digest;
};

void PrintTo(Digest const& row, std::ostream* out)
{
    *out << row.name;
}

Digest const kDigests[] = {
    {"NoBytes", "", "e3b0c44298fc1c149afbf4c8996fb92427ae41e4649b934ca495991b7852b855"},
    {"Abc", "abc", "ba7816bf8f01cfea414140de5dae2223b00361a396177a9cb410ff61f20015ad"},
    {"TwoBlocks", "abcdbcdecdefdefgefghfghighijhijkijkljklmklmnlmnomnopnopq",
     "248d6a61d20638b8e5c026930c3e6039a33ce45964ff2167f6ecedd419db06c1"},
    {"Million", std::string(1'000'000, 'a'), "cdc76e5c9914fb9281a1c7e284d73e67f1809a48a497200e046d39ccc7112cd0"},
    {"OneNul", std::string(1, '\0'), "6e340b9cffb37a989ca544e6bb780a2c78901d3fb33738768511a30617afa01d"},
    {"NotText", "\xFF\x80", "85c61621ebd04403f66d96fe300cf10b3844de7358184f1276cb08790fd135f1"},
};

class Sha : public testing::TestWithParam<Digest> {};

INSTANTIATE_TEST_SUITE_P(Standard, Sha, testing::ValuesIn(kDigests), support::rowName);

TEST_P(Sha, OfBytesIsTheStandardDigest)
{
    std::string const& bytes = GetParam().bytes;
    EXPECT_EQ(generateSha(bytes.data(), static_cast<int>(bytes.size())).ansi_str(), GetParam().digest);
}

TEST_P(Sha, OfATextWithOneByteForEachCharacterIsThatOfItsBytes)
{
    std::string const& bytes = GetParam().bytes;
    EXPECT_EQ(generateSha(OdString(bytes.data(), bytes.size(), CP_UTF_8)).ansi_str(), GetParam().digest);
}

TEST_P(Sha, IsTheSameHoweverTheBytesAreCut)
{
    std::string const& bytes = GetParam().bytes;
    for (std::size_t const piece : {std::size_t{1}, std::size_t{63}, std::size_t{64}, std::size_t{65}}) {
        ContentDigest digest;
        for (std::size_t at = 0; at < bytes.size(); at += piece) {
            digest.update(bytes.data() + at, std::min(piece, bytes.size() - at));
        }
        EXPECT_EQ(digest.finish().ansi_str(), GetParam().digest) << "pieces of " << piece;
    }
}

TEST(ShaOfBytes, TakesNoMoreThanItIsGiven)
{
    EXPECT_EQ(generateSha("abcd", 3).ansi_str(), "ba7816bf8f01cfea414140de5dae2223b00361a396177a9cb410ff61f20015ad");
    EXPECT_EQ(generateSha(nullptr, 0).ansi_str(), "e3b0c44298fc1c149afbf4c8996fb92427ae41e4649b934ca495991b7852b855");
}

// The narrow form is longer than the text, and only as many bytes as the text has characters are taken.
TEST(ShaOfAText, CoversAsManyBytesAsTheTextHasCharacters)
{
    EXPECT_EQ(
        generateSha(OdString(L"\u00E4")).ansi_str(),
        "ae3f4619b0413d70d3004b9131c3752153074e45725be13b9a148978895e359e");
    EXPECT_EQ(
        generateSha(OdString(L"a\u56FEb")).ansi_str(),
        "c383dfdfeb8a6a06b9d3e6e09eb5b16078467dda5e580142a28aace213b6c3ef");
    EXPECT_EQ(
        generateSha(OdString(L"\U0001F600")).ansi_str(),
        "fde502858306c235a3121e42326b53228b7ef4690eeed92a2b2eafe73c03a3ef");
}

TEST(ConflictInfo, HoldsItsPaths)
{
    ConflictInfo const info(L"plan.dwg", L"plan.theirs.dwg", L"plan.base.dwg");
    EXPECT_EQ(info.path, OdString(L"plan.dwg"));
    EXPECT_EQ(info.theirsPath, OdString(L"plan.theirs.dwg"));
    EXPECT_EQ(info.basePath, OdString(L"plan.base.dwg"));
}

TEST(MetaInfo, IsDestroyedThroughItself)
{
    EXPECT_TRUE(std::has_virtual_destructor_v<MetaInfo>);
    EXPECT_TRUE((std::is_base_of_v<MetaInfo, ConflictInfo>));
    EXPECT_TRUE(std::has_virtual_destructor_v<StatusImp>);
}

TEST(StatusRef, TellsPathAndStatus)
{
    StatusRef const status(L"sub/plan.dwg", FileChange::removed);
    EXPECT_EQ(status.path(), OdString(L"sub/plan.dwg"));
    EXPECT_EQ(status.status(), FileChange::removed);
}

TEST(StatusRef, CarriesNothingWhenItIsMade)
{
    StatusRef const status(L"plan.dwg", FileChange::added);
    EXPECT_EQ(status.metaInfo(), nullptr);
    EXPECT_TRUE(status.selected);
}

TEST(StatusRef, EqualsOneOfTheSamePathAndStatus)
{
    StatusRef const status(L"plan.dwg", FileChange::modified);
    EXPECT_TRUE(status == status);
    EXPECT_TRUE(status == StatusRef(L"plan.dwg", FileChange::modified));
    EXPECT_FALSE(status == StatusRef(L"plan.dwg", FileChange::removed));
    EXPECT_FALSE(status == StatusRef(L"Plan.dwg", FileChange::modified));
    EXPECT_FALSE(status == StatusRef(L"", FileChange::modified));
}

TEST(StatusRef, EqualsWhateverItCarries)
{
    StatusRef status(L"plan.dwg", FileChange::modified);
    status.metaInfo() = std::make_shared<ConflictInfo>(L"plan.dwg", L"", L"");
    status.selected = false;
    EXPECT_TRUE(status == StatusRef(L"plan.dwg", FileChange::modified));
}

TEST(StatusRef, DoesNotEqualOneThatWasMovedFrom)
{
    StatusRef const status(L"plan.dwg", FileChange::modified);
    StatusRef moved = status;
    StatusRef const target = std::move(moved);
    EXPECT_FALSE(status == moved);
    EXPECT_TRUE(status == target);
}

TEST(StatusRef, SharesWhatItCarriesAmongItsCopies)
{
    StatusRef status(L"plan.dwg", FileChange::modified);
    StatusRef const copy = status;
    StatusRef const copyOfTheCopy = copy;
    auto const info = std::make_shared<ConflictInfo>(L"plan.dwg", L"", L"");
    status.metaInfo() = info;
    EXPECT_EQ(copy.metaInfo(), info);
    EXPECT_EQ(copyOfTheCopy.metaInfo(), info);
    copy.metaInfo() = nullptr;
    EXPECT_EQ(status.metaInfo(), nullptr);
}

TEST(StatusRef, GivesOneReferenceInBothForms)
{
    StatusRef status(L"plan.dwg", FileChange::modified);
    EXPECT_EQ(&status.metaInfo(), &std::as_const(status).metaInfo());
}

TEST(StatusRef, DoesNotShareWithAnEqualOne)
{
    StatusRef status(L"plan.dwg", FileChange::modified);
    StatusRef const equal(L"plan.dwg", FileChange::modified);
    status.metaInfo() = std::make_shared<ConflictInfo>(L"plan.dwg", L"", L"");
    EXPECT_EQ(equal.metaInfo(), nullptr);
}

} // namespace
