#include "Common/NumberText.h"

#include <gtest/gtest.h>

#include <climits>
#include <cstdlib>
#include <string>

TEST(NumberText, ReadsLeadingDigits)
{
    EXPECT_EQ(12, _atoi(L"12ab"));
    EXPECT_EQ(0, _atoi(L"-3"));
    EXPECT_EQ(1, _atoi(L"1\uFF12"));
    EXPECT_EQ(INT_MIN, _atoi(L"2147483648"));
}

TEST(NumberText, ShowsAMinusInRadixTenOnly)
{
    char szText[80];
    EXPECT_STREQ("ffffff01", itoa(-255, szText, 16));
    EXPECT_STREQ("-2147483648", itoa(INT_MIN, szText, 10));
    EXPECT_EQ("1" + std::string(31, '0'), itoa(INT_MIN, szText, 2));
    EXPECT_EQ(nullptr, itoa(5, szText, 37));
    _ultoa(ULONG_MAX, szText, 2);
    EXPECT_EQ(std::string(sizeof(long) * CHAR_BIT, '1'), szText);
    _ltoa(LONG_MIN, szText, 10);
    EXPECT_EQ(std::to_string(LONG_MIN), szText);
    _ltoa(-1, szText, 16);
    EXPECT_EQ(std::string(sizeof(long) * 2, 'F'), szText);
}

TEST(NumberText, AllocatesWithoutABuffer)
{
    char* szText = itoa(INT_MIN, nullptr, 10);
    EXPECT_STREQ("-2147483648", szText);
    std::free(szText);
}
