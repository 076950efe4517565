#include "Platform/LogSink.h"
#include "tests/Support/LogCapture.h"

#include <android/log.h>

#include <gtest/gtest.h>

#include <string>

TEST(Log, HandsFormattedLinesToTheSink)
{
    const CLogCapture clLog;
    EXPECT_EQ(1, __android_log_print(3, "tag", "%d of %s", 7, "nine"));
    EXPECT_EQ(1, __android_log_print(6, "other", "100%%\n"));
    ASSERT_EQ(2U, clLog.Lines().size());
    EXPECT_EQ((tag_LogLine{3, "tag", "7 of nine"}), clLog.Lines()[0]);
    EXPECT_EQ((tag_LogLine{6, "other", "100%\n"}), clLog.Lines()[1]);
}

TEST(Log, CutsLongLines)
{
    const CLogCapture clLog;
    __android_log_print(6, "tag", "%s", std::string(5000, 'x').c_str());
    EXPECT_EQ(std::string(4095, 'x'), clLog.Lines().at(0).strText);
}

TEST(Log, WithoutASinkOnlyErrorsAreSeen)
{
    testing::internal::CaptureStderr();
    testing::internal::CaptureStdout();
    EXPECT_EQ(0, __android_log_print(3, "tag", "quiet"));
    EXPECT_EQ(1, __android_log_print(6, "tag", "loud %d", 1));
    EXPECT_EQ("tag: loud 1\n", testing::internal::GetCapturedStderr());
    EXPECT_EQ("", testing::internal::GetCapturedStdout());
}
