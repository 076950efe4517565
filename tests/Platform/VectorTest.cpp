#include <utils/Vector.h>

#include <gtest/gtest.h>

#include <cstdint>

TEST(Vector, RefusesMoreThanMemoryCanHold)
{
    android::Vector<long> vItems;
    vItems.push(1);
    // Computed in bytes, the second wraps around to almost nothing.
    for (const size_t uCapacity : {SIZE_MAX / sizeof(long), SIZE_MAX / sizeof(long) + 2})
    {
        EXPECT_EQ(-1, vItems.setCapacity(uCapacity));
    }
    ASSERT_EQ(1U, vItems.size());
    EXPECT_EQ(1, vItems[0]);
}
