#include <utils/Vector.h>

#include <gtest/gtest.h>

#include <limits>

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

// The address sanitizer ends a process that asks for so much.
#ifndef __SANITIZE_ADDRESS__
TEST(Vector, SaysWhenMemoryRunsOut)
{
    android::Vector<long> vItems;
    vItems.push(1);
    // More than any process has, without overflowing the number of bytes.
    EXPECT_EQ(-1, vItems.setCapacity(std::numeric_limits<size_t>::max() / 2 / sizeof(long)));
    EXPECT_EQ(1U, vItems.size());
    EXPECT_EQ(1, vItems[0]);
}
#endif
