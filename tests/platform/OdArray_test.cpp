#include "platform/sdk/OdArray.h"

#include <gmock/gmock.h>
#include <vector>

namespace {

using testing::ElementsAre;

std::vector<int> values(OdArray<int> const& array)
{
    return {array.begin(), array.end()};
}

TEST(OdArray, IsEmptyWhenMade)
{
    OdArray<int> const array;
    EXPECT_TRUE(array.isEmpty());
    EXPECT_EQ(array.size(), 0U);
    EXPECT_EQ(array.begin(), array.end());
}

TEST(OdArray, KeepsValuesInTheOrderOfAppending)
{
    OdArray<int> array;
    for (int value : {3, 1, 2}) {
        array.append(value);
    }
    EXPECT_FALSE(array.isEmpty());
    EXPECT_EQ(array.size(), 3U);
    EXPECT_EQ(array.first(), 3);
    EXPECT_EQ(array[2], 2);
    EXPECT_THAT(values(array), ElementsAre(3, 1, 2));
}

TEST(OdArray, CopiesAreIndependent)
{
    OdArray<int> array;
    array.append(1);
    OdArray<int> const copy = array;
    array.append(2);
    EXPECT_THAT(values(copy), ElementsAre(1));
}

TEST(OdArray, CanAppendAnElementOfItself)
{
    OdArray<int> array;
    array.append(1);
    for (int i = 0; i < 20; ++i) {
        array.append(array.first());
    }
    EXPECT_THAT(values(array), testing::Each(1));
}

// Finds no memory for the copy after the next.
struct Greedy {
    int value = 0;
    static inline int copiesLeft = 0;

    explicit Greedy(int number) : value(number) {}
    Greedy(Greedy const& other) : value(other.value)
    {
        if (copiesLeft-- == 0) {
            throw std::bad_alloc();
        }
    }
};

TEST(OdArray, LackOfMemoryIsAnErrorAndLeavesTheArrayAsItWas)
{
    OdArray<Greedy> array;
    Greedy::copiesLeft = 100;
    array.append(Greedy(1));
    Greedy::copiesLeft = 0;
    try {
        array.append(Greedy(2));
        FAIL() << "nothing was thrown";
    } catch (OdError const& error) {
        EXPECT_EQ(error.code(), eOutOfMemory);
    }
    ASSERT_EQ(array.size(), 1U);
    EXPECT_EQ(array.first().value, 1);
}

} // namespace
