#include "storage_test.h"

#include "host/storage/storage_url.h"
#include "tests/support/utf8.h"

namespace storage_tests {
namespace {

std::string const kHex = "ba7816bf8f01cfea414140de5dae2223b00361a396177a9cb410ff61f20015ad";

TEST(StorageUrl, NamesTheDigestOfItsContent)
{
    EXPECT_EQ(tav::digestOf(support::fromUtf8("po:" + kHex)), tav::digestFromHex(kHex));
    EXPECT_EQ(tav::digestOf(support::fromUtf8("tf:Plan_1-0a.b#" + kHex)), tav::digestFromHex(kHex));
}

TEST(StorageUrl, IsRefusedInAnyOtherForm)
{
    std::string const capitals = "BA7816BF8F01CFEA414140DE5DAE2223B00361A396177A9CB410FF61F20015AD";
    for (std::string const& url :
         {std::string(),
          std::string("po:"),
          "po" + kHex,
          "po:" + kHex + "0",
          "po:" + kHex.substr(1),
          "po:" + capitals,
          "po: " + kHex.substr(1),
          "PO:" + kHex,
          "tf:" + kHex,
          "tf:#" + kHex,
          std::string("tf:plan#"),
          "tf:plan#" + capitals,
          "tf:plan#3#" + kHex,
          "tf:../plan#" + kHex,
          "tf:a/b#" + kHex,
          "tf:.plan#" + kHex,
          "tf:..#" + kHex,
          "tf:pl an#" + kHex,
          "tf:pl\xc3\xa4n#" + kHex,
          "tf:plan\n#" + kHex,
          std::string("tf:pl\0n#", 8) + kHex,
          "tf:" + std::string(101, 'a') + "#" + kHex,
          "tf:plan#" + kHex + "\n",
          "xx:plan#" + kHex}) {
        EXPECT_EQ(tav::digestOf(support::fromUtf8(url)), std::nullopt) << url;
    }
}

TEST(StorageUrl, ReadsBackAsItWasWritten)
{
    for (std::string const& url : {"po:" + kHex, "tf:" + std::string(100, 'a') + "#" + kHex}) {
        auto const parsed = tav::parseUrl(support::fromUtf8(url));
        ASSERT_TRUE(parsed.has_value());
        EXPECT_EQ(parsed->text(), support::fromUtf8(url));
    }
}

TEST(NewStoreName, IsLegibleAndSafe)
{
    auto const stem = [](std::string const& path) {
        std::string const name = tav::newStoreName(support::fromUtf8(path), {});
        EXPECT_TRUE(tav::isStoreName(name)) << name;
        EXPECT_EQ(name[name.size() - 17], '-');
        return name.substr(0, name.size() - 17);
    };
    EXPECT_EQ(stem("floors/Plan-1_a.dwg"), "Plan-1_a");
    EXPECT_EQ(stem("a.b c..d.dwg"), "a_b_c_d");
    EXPECT_EQ(stem("\xff\xfe.dwg"), "_");
    EXPECT_EQ(stem(".dwg"), "_");
    EXPECT_EQ(stem("..dwg"), "_");
    EXPECT_EQ(stem(std::string(200, 'x') + ".dwg"), std::string(40, 'x'));
}

TEST(NewStoreName, DependsOnPathAndContentOnly)
{
    tav::Digest const other{1};
    EXPECT_EQ(tav::newStoreName(L"a/plan.dwg", {}), tav::newStoreName(L"a/plan.dwg", {}));
    EXPECT_NE(tav::newStoreName(L"a/plan.dwg", {}), tav::newStoreName(L"b/plan.dwg", {}));
    EXPECT_NE(tav::newStoreName(L"a/plan.dwg", {}), tav::newStoreName(L"a/plan.dwg", other));
}

} // namespace
} // namespace storage_tests
