#include <android/log.h>
#include <cstdint>
#include <gtest/gtest.h>
#include <utils/Vector.h>

TEST(Log, WithoutASinkOnlyErrorsAreSeen)
{
    testing::internal::CaptureStderr();
    EXPECT_EQ(0, __android_log_print(3, "tag", "quiet"));
    EXPECT_EQ(1, __android_log_print(6, "tag", "loud %d", 1));
    EXPECT_EQ("tag: loud 1\n", testing::internal::GetCapturedStderr());
}

TEST(Vector, RefusesMoreThanMemoryCanHold)
{
    android::Vector<long> vItems;
    vItems.push(1);
    // Computed in bytes, the second wraps around to almost nothing.
    EXPECT_EQ(-1, vItems.setCapacity(SIZE_MAX / sizeof(long)));
    EXPECT_EQ(-1, vItems.setCapacity(SIZE_MAX / sizeof(long) + 2));
    ASSERT_EQ(1U, vItems.size());
    EXPECT_EQ(1, vItems[0]);
}
