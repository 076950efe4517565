#include "Common/WideString.h"

#include <gtest/gtest.h>

#include <climits>
#include <string>

namespace
{

constexpr wchar_t HIGHEST_UNIT = static_cast<wchar_t>(0xFFFFFFFFU);

} // namespace

TEST(WideString, ComparesBySubtraction)
{
    const wchar_t szHighest[] = {HIGHEST_UNIT, 0};
    const wchar_t szEmptyMark[] = {0x7FFFFFFF, 0};
    struct
    {
        const wchar_t* szLeft;
        const wchar_t* szRight;
        int iExpected;
    } const cases[] = {
        {L"abc", L"abc", 0},
        {L"abc", L"abe", -2},
        {L"ab", L"a", 'b'},
        {L"a", L"ab", -'b'},
        {L"张", L"a", 0x5F20 - 'a'},
        {szEmptyMark, L"龥", 0x7FFFFFFF - 0x9FA5},
        // Wraps, and the same whether units are signed or not.
        {szHighest, L"", -1},
        {szHighest, szEmptyMark, INT_MIN},
    };
    for (const auto& item : cases)
    {
        EXPECT_EQ(item.iExpected, _wcscmp(item.szLeft, item.szRight));
        EXPECT_EQ(item.iExpected, _wcsncmp(item.szLeft, item.szRight, 9));
        EXPECT_EQ(0, _wcsncmp(item.szLeft, item.szRight, 0));
    }
    EXPECT_EQ(0, _wcsncmp(L"abc", L"abd", 2));
    // Nothing behind the terminators counts.
    EXPECT_EQ(0, _wcsncmp(L"ab\0c", L"ab\0d", 4));
}

TEST(WideString, ChangesTheCaseOfAsciiLettersOnly)
{
    wchar_t szText[] = L"@AZ[`az{äÄа张ſK9";
    EXPECT_EQ(szText, _wcsupr(szText));
    EXPECT_STREQ(L"@AZ[`AZ{äÄа张ſK9", szText);
    EXPECT_EQ(szText, _wcslwr(szText));
    EXPECT_STREQ(L"@az[`az{äÄа张ſK9", szText);
    EXPECT_EQ(HIGHEST_UNIT, _towlower(HIGHEST_UNIT));
    EXPECT_EQ(HIGHEST_UNIT, _towupr(HIGHEST_UNIT));

    char szBytes[] = "aZ1 \xE5\xBC\xA0z";
    EXPECT_STREQ("AZ1 \xE5\xBC\xA0Z", strupr(szBytes));
}

TEST(WideString, CopiesAndNamesTheOrder)
{
    char szBytes[] = "abcdef";
    EXPECT_EQ(szBytes + 2, _memcpy(szBytes + 2, szBytes, 4));
    EXPECT_STREQ("ababab", szBytes) << "forward";
    wchar_t szTarget[] = L"xxxx";
    EXPECT_STREQ(L"abxx", _wcsncpy(szTarget, L"ab", 2));
    EXPECT_EQ(std::wstring(L"ab\0\0", 4), std::wstring(_wcsncpy(szTarget, L"ab", 4), 4));
    EXPECT_EQ(1, _CompareString(0, 0, L"ab", 2, L"abc", 3));
    EXPECT_EQ(3, _CompareString(0, 0, L"a", 1, L"Z", 1));
    EXPECT_EQ(2, _CompareString(0, 0, L"abc", 3, L"abc", 3));
}
