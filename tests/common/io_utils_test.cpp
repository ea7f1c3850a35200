#include "common/mu_common_io_utils.h"

#include "tests/support/recording_io.h"

#include <cstddef>
#include <cstring>
#include <gmock/gmock.h>
#include <type_traits>

namespace {

using common::IoInterface;
using support::RecordingIo;
using testing::ElementsAre;

/// As much as a host has to define.
class SmallestHost final : public IoInterface {
public:
    std::int32_t accept(OdString const& /*path*/) const override { return -1; }
    void report(WriteOutcome const& /*outcome*/) const override {}
};

/// The place of a virtual operation in the table, in bytes: a pointer to it holds that, whatever else it holds.
template <class Member>
std::ptrdiff_t slotOf(Member member)
{
    static_assert(sizeof member >= sizeof(std::ptrdiff_t));
    std::ptrdiff_t slot = 0;
    std::memcpy(&slot, &member, sizeof slot);
    return slot;
}

TEST(IoInterface, HasItsSlotsInTheirOrder)
{
    std::ptrdiff_t const first = slotOf(&IoInterface::message);
    constexpr std::ptrdiff_t kSlot = sizeof(void*);
    EXPECT_EQ(slotOf(&IoInterface::accept), first + kSlot);
    EXPECT_EQ(slotOf(&IoInterface::progress), first + 2 * kSlot);
    EXPECT_EQ(slotOf(&IoInterface::report), first + 3 * kSlot);
}

TEST(IoInterface, IsNotDestroyedThroughItself)
{
    EXPECT_FALSE(std::is_destructible_v<IoInterface>);
    EXPECT_FALSE(std::has_virtual_destructor_v<IoInterface>);
    EXPECT_TRUE(std::is_abstract_v<IoInterface>);
}

TEST(IoInterface, HoldsNoData)
{
    EXPECT_EQ(sizeof(IoInterface), sizeof(void*));
}

TEST(IoInterface, AsksTheHostOnlyForAnswersAndOutcomes)
{
    SmallestHost const host;
    IoInterface const& io = host;
    io.message(L"text");
    io.progress(1, 2);
    EXPECT_EQ(io.accept(L"plan.dwg"), -1);
}

TEST(RecordingIo, WritesDownWhatItIsTold)
{
    RecordingIo const recording(5);
    IoInterface const& io = recording;
    ErrorMessage coded(L"disk full");
    coded.code = 5;
    io.report(WriteOutcome(std::in_place));
    io.report(ErrorMessage(L"Error writing to file '%ls'", L"tav.state"));
    io.report(coded);
    EXPECT_EQ(io.accept(L"plan \u00E4.dwg"), 5);
    io.message(L"text");
    io.progress(1, 2);
    EXPECT_THAT(
        recording.calls(),
        ElementsAre(
            "report success", "report error: Error writing to file 'tav.state'", "report error 5: disk full",
            "accept plan \u00E4.dwg", "message text", "progress 1 of 2"));
}

} // namespace
