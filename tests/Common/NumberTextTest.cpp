#include "Common/NumberText.h"

#include <gtest/gtest.h>

#include <climits>
#include <cstdlib>
#include <random>
#include <string>

namespace
{

std::string Itoa(int iValue, int iRadix)
{
    char szBuffer[40] = "untouched";
    return itoa(iValue, szBuffer, iRadix) == szBuffer ? szBuffer : std::string("null, ") + szBuffer;
}

std::string Ultoa(unsigned long ulValue, int iRadix)
{
    char szBuffer[80];
    _ultoa(ulValue, szBuffer, iRadix);
    return szBuffer;
}

std::string Ltoa(long lValue, int iRadix)
{
    char szBuffer[80];
    _ltoa(lValue, szBuffer, iRadix);
    return szBuffer;
}

} // namespace

TEST(NumberText, ReadsLeadingDigits)
{
    EXPECT_EQ(12, _atoi(L"12ab"));
    EXPECT_EQ(0, _atoi(L"-3"));
    EXPECT_EQ(0, _atoi(L" 7"));
    EXPECT_EQ(0, _atoi(L""));
    EXPECT_EQ(7, _atoi(L"0007"));
    EXPECT_EQ(1, _atoi(L"1\uFF12"));
    EXPECT_EQ(INT_MAX, _atoi(L"2147483647"));
    EXPECT_EQ(INT_MIN, _atoi(L"2147483648"));
    EXPECT_EQ(1, _atoi(L"4294967297"));
}

TEST(NumberText, ItoaShowsAMinusInRadixTenOnly)
{
    EXPECT_EQ("ffffff01", Itoa(-255, 16));
    EXPECT_EQ("-255", Itoa(-255, 10));
    EXPECT_EQ("0", Itoa(0, 10));
    EXPECT_EQ("0", Itoa(0, 2));
    EXPECT_EQ("zz", Itoa(35 * 36 + 35, 36));
    EXPECT_EQ("-2147483648", Itoa(INT_MIN, 10));
    EXPECT_EQ("2147483647", Itoa(INT_MAX, 10));
    EXPECT_EQ("1" + std::string(31, '0'), Itoa(INT_MIN, 2));
    EXPECT_EQ(std::string(32, '1'), Itoa(-1, 2));
}

TEST(NumberText, ItoaRefusesOtherRadixes)
{
    for (int iRadix : {1, 0, -10, 37, INT_MIN, INT_MAX})
    {
        EXPECT_EQ("null, untouched", Itoa(5, iRadix));
        EXPECT_EQ(nullptr, itoa(5, nullptr, iRadix));
    }
}

TEST(NumberText, ItoaAllocatesWithoutABuffer)
{
    for (int iValue : {0, -7, INT_MIN})
    {
        char* szText = itoa(iValue, nullptr, 10);
        ASSERT_NE(nullptr, szText);
        EXPECT_EQ(std::to_string(iValue), szText);
        std::free(szText);
    }
}

TEST(NumberText, LongFormsUseUpperCase)
{
    EXPECT_EQ("FF", Ultoa(255, 16));
    EXPECT_EQ("0", Ultoa(0, 36));
    EXPECT_EQ(std::string(sizeof(long) * CHAR_BIT, '1'), Ultoa(ULONG_MAX, 2));
    EXPECT_EQ("-5", Ltoa(-5, 10));
    EXPECT_EQ("5", Ltoa(5, 10));
    EXPECT_EQ(std::string(sizeof(long) * 2, 'F'), Ltoa(-1, 16));
    EXPECT_EQ(std::to_string(LONG_MIN), Ltoa(LONG_MIN, 10));
    EXPECT_EQ("8" + std::string(sizeof(long) * 2 - 1, '0'), Ltoa(LONG_MIN, 16));
}

TEST(NumberText, AllRadixesReadBack)
{
    std::mt19937_64 random(72);
    for (int iRadix = NUMBER_MIN_RADIX; iRadix <= NUMBER_MAX_RADIX; ++iRadix)
    {
        for (int iRound = 0; iRound < 200; ++iRound)
        {
            const unsigned long ulValue =
                static_cast<unsigned long>(random()) >> (random() % (sizeof(long) * CHAR_BIT));
            EXPECT_EQ(ulValue, std::strtoul(Ultoa(ulValue, iRadix).c_str(), nullptr, iRadix));
            const int iValue = static_cast<int>(ulValue);
            const unsigned long ulBack =
                std::strtoul(Itoa(iValue, iRadix).c_str(), nullptr, iRadix);
            EXPECT_EQ(static_cast<unsigned>(iValue), static_cast<unsigned>(ulBack));
        }
    }
}
