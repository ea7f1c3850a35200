#include "platform/sdk/OdError.h"

#include <gmock/gmock.h>

namespace {

TEST(OdError, CarriesItsMessage)
{
    OdError const error(OdString(L"no plan \u20AC"));
    EXPECT_EQ(error.description(), OdString(L"no plan \u20AC"));
    EXPECT_STREQ(error.what(), "no plan \xE2\x82\xAC");
    EXPECT_EQ(error.code(), eOk);
}

TEST(OdError, CarriesAnEnglishSentenceForItsCode)
{
    OdError const error(eOutOfMemory);
    EXPECT_EQ(error.description(), OdString(L"Out of memory."));
    EXPECT_STREQ(error.what(), "Out of memory.");
    EXPECT_EQ(error.code(), eOutOfMemory);
    EXPECT_EQ(OdError(eOk).description(), OdString(L"No error."));
    EXPECT_EQ(OdError(static_cast<OdResult>(1)).description(), OdString(L"Unknown error."));
}

TEST(OdError, NamesAFileByItsBytes)
{
    EXPECT_STREQ(OdError(OdString("plan\xFF", CP_UTF_8)).what(), "plan\xFF");
}

TEST(OdError, IsCaughtAsAStandardException)
{
    try {
        throw OdError(OdString(L"no plan"));
    } catch (std::exception const& error) {
        EXPECT_STREQ(error.what(), "no plan");
    }
}

TEST(OdError, CopiesCarryTheSame)
{
    OdError const copy = OdError(eOutOfMemory);
    OdError const second(copy);
    EXPECT_EQ(second.description(), OdString(L"Out of memory."));
    EXPECT_EQ(second.code(), eOutOfMemory);
}

} // namespace
