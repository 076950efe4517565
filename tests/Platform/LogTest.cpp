#include <android/log.h>

#include <gtest/gtest.h>

TEST(Log, WithoutASinkOnlyErrorsAreSeen)
{
    testing::internal::CaptureStderr();
    EXPECT_EQ(0, __android_log_print(3, "tag", "quiet"));
    EXPECT_EQ(1, __android_log_print(6, "tag", "loud %d", 1));
    EXPECT_EQ("tag: loud 1\n", testing::internal::GetCapturedStderr());
}
