#include "host/text/size.h"

#include <gmock/gmock.h>

namespace {

using tav::parseSize;
using testing::Eq;
using testing::Optional;

TEST(Size, IsAWholeNumberOfBytesOrOfAUnit)
{
    EXPECT_THAT(parseSize("0"), Optional(0U));
    EXPECT_THAT(parseSize("1234"), Optional(1'234U));
    EXPECT_THAT(parseSize("500 MB"), Optional(500'000'000U));
    EXPECT_THAT(parseSize("7kB"), Optional(7'000U));
    EXPECT_THAT(parseSize("2GB"), Optional(2'000'000'000U));
    EXPECT_THAT(parseSize("18446744 TB"), Optional(18'446'744'000'000'000'000U));
}

TEST(Size, IsNothingElse)
{
    for (char const* const typed :
         {"", " ", "MB", "-1", "+1", "1.5 GB", "1 gb", "1  GB", "1 ", "1 GB ", " 1", "1 G", "18446745 TB",
          "18446744073709551616", "0x10"}) {
        EXPECT_THAT(parseSize(typed), Eq(std::nullopt)) << '"' << typed << '"';
    }
}

} // namespace
