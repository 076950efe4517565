#include <utils/Vector.h>

#include <gtest/gtest.h>

#include <cstdint>

TEST(Vector, KeepsItemsInOrderWhileItGrows)
{
    android::Vector<int> vItems;
    EXPECT_TRUE(vItems.isEmpty());
    for (int i = 0; i < 1000; ++i)
    {
        vItems.push(i);
    }
    EXPECT_EQ(1000, vItems.add(1000));
    ASSERT_EQ(1001U, vItems.size());
    for (int i = 0; i <= 1000; ++i)
    {
        ASSERT_EQ(i, vItems[static_cast<size_t>(i)]);
    }
    EXPECT_EQ(vItems.array(), vItems.editArray());
}

TEST(Vector, ReplacesOnlyWhatItHas)
{
    android::Vector<int> vItems;
    EXPECT_EQ(-1, vItems.replaceAt(5, 0));
    vItems.push(1);
    EXPECT_EQ(0, vItems.replaceAt(5, 0));
    EXPECT_EQ(-1, vItems.replaceAt(6, 1));
    EXPECT_EQ(5, vItems.itemAt(0));
    vItems.editItemAt(0) = 7;
    EXPECT_EQ(7, vItems[0]);
}

TEST(Vector, ReservesAndClears)
{
    android::Vector<long> vItems;
    EXPECT_EQ(50, vItems.setCapacity(50));
    EXPECT_EQ(50, vItems.setCapacity(10));
    vItems.push(1);
    const long* pBefore = vItems.array();
    for (long l = 1; l < 50; ++l)
    {
        vItems.push(l);
    }
    EXPECT_EQ(pBefore, vItems.array());
    vItems.clear();
    EXPECT_EQ(0U, vItems.size());
    EXPECT_EQ(0U, vItems.capacity());
    vItems.push(9);
    EXPECT_EQ(9, vItems[0]);
}

TEST(Vector, RefusesMoreThanMemoryCanHold)
{
    android::Vector<long> vItems;
    vItems.push(1);
    // Computed in bytes, the second wraps around to almost nothing.
    for (const size_t uCapacity : {SIZE_MAX / sizeof(long), SIZE_MAX / sizeof(long) + 2})
    {
        EXPECT_EQ(-1, vItems.setCapacity(uCapacity));
    }
    EXPECT_EQ(1U, vItems.size());
    EXPECT_EQ(1, vItems[0]);
}
