// Wide text, UTF-8 and numbers: the operations of old C libraries whose results programs rely on.

#include "Common/NumberText.h"
#include "Common/Utf8.h"
#include "Common/WideString.h"

#include <climits>
#include <cstdlib>
#include <gtest/gtest.h>
#include <string>
#include <tuple>

namespace
{

constexpr wchar_t UNTOUCHED = 0x1234;
constexpr wchar_t HIGHEST_UNIT = static_cast<wchar_t>(0xFFFFFFFFU);

std::string PrintedBy(const std::wstring& strText)
{
    testing::internal::CaptureStdout();
    const int iPrinted = _wprintf(strText.c_str(), 1, "ignored");
    std::string strPrinted = testing::internal::GetCapturedStdout();
    EXPECT_EQ(static_cast<int>(strPrinted.size()), iPrinted);
    return strPrinted;
}

} // namespace

TEST(NumberText, ReadsDigitsAndWritesAMinusInRadixTenOnly)
{
    EXPECT_EQ(12, _atoi(L"12ab"));
    EXPECT_EQ(0, _atoi(L"-3"));
    EXPECT_EQ(1, _atoi(L"1\uFF12"));
    EXPECT_EQ(INT_MIN, _atoi(L"2147483648"));
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
    char* szAllocated = itoa(INT_MIN, nullptr, 10);
    EXPECT_STREQ("-2147483648", szAllocated);
    std::free(szAllocated);
}

// On a failure, what stands before the bytes that do not decode stays written.
TEST(Utf8, DecodesUpToTheBound)
{
    const std::tuple<const char*, int, int, std::wstring> ROWS[] = {
        // bytes, last byte, result, text
        {"\xE5\xBC\xA0", 1, -201, L""},
        {"zhang", 1, 2, L"zh"},
        {"zhang", -1, 0, L""},
        {"zhang", INT32_MAX, 5, L"zhang"},
        {"a\xE5\xBC\xA0z", 2, -201, L"a"},
        {"\xC1\x81", 9, 1, L"A"},
        {"ab\xBF", 9, -201, L"ab"},
        {"ab\xF0\x9F\x98\x80", 9, -201, L"ab"},
        {"ab\xC3", 9, -201, L"ab"},
        {"ab\xC3\x28", 9, -201, L"ab"},
        {"ab\xE5\xBC", 9, -201, L"ab"},
        {"ab\xE5\xBC\x41", 9, -201, L"ab"},
    };
    for (const auto& [szBytes, iLastByte, iResult, strText] : ROWS)
    {
        std::wstring strTarget(10, UNTOUCHED);
        EXPECT_EQ(iResult, Utf82Unicode(szBytes, strTarget.data(), iLastByte));
        EXPECT_EQ(strText, strTarget.substr(0, strTarget.find(UNTOUCHED)));
    }
}

TEST(Utf8, EncodesUpToTheBound)
{
    const std::wstring strText = {L'a', 0x10FFFF, static_cast<wchar_t>(0x80000041U), L'z'};
    char szBytes[20] = {};
    EXPECT_EQ(8, Unicode2Utf8(strText.c_str(), szBytes, INT32_MAX));
    EXPECT_STREQ("a\xEF\xBF\xBD\xEF\xBF\xBDz", szBytes);
    EXPECT_EQ(4, Unicode2Utf8(strText.c_str(), szBytes, 1));
    EXPECT_EQ(0, Unicode2Utf8(strText.c_str(), szBytes, -1));
    for (uint32_t uUnit = 1; uUnit <= 0xFFFF; ++uUnit) // each comes back
    {
        const wchar_t szUnit[] = {static_cast<wchar_t>(uUnit), 0};
        wchar_t szBack[4] = {};
        const int iBytes = _wcstombs(szBytes, szUnit, 1);
        ASSERT_EQ(uUnit < 0x80 ? 1 : uUnit < 0x800 ? 2 : 3, iBytes);
        ASSERT_EQ(1, _mbstowcs(szBack, szBytes, iBytes - 1));
        ASSERT_EQ(szUnit[0], szBack[0]);
    }
}

TEST(Utf8, PrintsAFormatAsItStandsAndFormatsBelowItsBuffer)
{
    EXPECT_EQ("100%d %s %n \xE5\xBC\xA0\n", PrintedBy(L"100%d %s %n 张"));
    EXPECT_EQ(std::string(128, 'x') + "\n", PrintedBy(std::wstring(128, L'x')));
    EXPECT_EQ(5000U * 3 + 1, PrintedBy(std::wstring(5000, L'张')).size());
    wchar_t szTarget[1100];
    EXPECT_EQ(25, _u_wsprintf(szTarget, L"%s=%d张张张张%c%05.1f", "\xE5\xBC\xA0", 42, 'x', 2.5));
    EXPECT_STREQ(L"张=42张张张张x002.5", szTarget);
    EXPECT_EQ(-1, _u_wsprintf(szTarget, L"%1024d", 1));
    EXPECT_STREQ(L"张=42张张张张x002.5", szTarget);
    EXPECT_EQ(1, _u_wsprintf(szTarget, L"%s", ""));
    EXPECT_EQ(1024, _u_wsprintf(szTarget, L"%1023d", 1));
    EXPECT_EQ(std::wstring(1022, L' ') + L'1', szTarget);
}

TEST(WideString, ComparesBySubtraction)
{
    const wchar_t szHighest[] = {HIGHEST_UNIT, 0};
    const wchar_t szEmptyMark[] = {0x7FFFFFFF, 0};
    const std::tuple<const wchar_t*, const wchar_t*, int> ROWS[] = {
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
    for (const auto& [szLeft, szRight, iExpected] : ROWS)
    {
        EXPECT_EQ(iExpected, _wcscmp(szLeft, szRight));
        EXPECT_EQ(iExpected, _wcsncmp(szLeft, szRight, 9));
        EXPECT_EQ(0, _wcsncmp(szLeft, szRight, 0));
    }
    EXPECT_EQ(0, _wcsncmp(L"abc", L"abd", 2));
    EXPECT_EQ(0, _wcsncmp(L"ab\0c", L"ab\0d", 4)) << "behind the terminators";
    EXPECT_EQ(1, _CompareString(0, 0, L"ab", 2, L"abc", 3));
    EXPECT_EQ(3, _CompareString(0, 0, L"a", 1, L"Z", 1));
    EXPECT_EQ(2, _CompareString(0, 0, L"abc", 3, L"abc", 3));
}

TEST(WideString, ChangesTheCaseOfAsciiLettersOnlyAndCopies)
{
    wchar_t szText[] = L"@AZ[`az{äÄа张ſ\u212A9";
    EXPECT_EQ(szText, _wcsupr(szText));
    EXPECT_STREQ(L"@AZ[`AZ{äÄа张ſ\u212A9", szText);
    EXPECT_EQ(szText, _wcslwr(szText));
    EXPECT_STREQ(L"@az[`az{äÄа张ſ\u212A9", szText);
    EXPECT_EQ(HIGHEST_UNIT, _towlower(HIGHEST_UNIT));
    EXPECT_EQ(HIGHEST_UNIT, _towupr(HIGHEST_UNIT));
    char szBytes[] = "aZ1 \xE5\xBC\xA0z";
    EXPECT_STREQ("AZ1 \xE5\xBC\xA0Z", strupr(szBytes));
    char szOverlapping[] = "abcdef";
    EXPECT_EQ(szOverlapping + 2, _memcpy(szOverlapping + 2, szOverlapping, 4));
    EXPECT_STREQ("ababab", szOverlapping) << "forward";
    wchar_t szTarget[] = L"xxxx";
    EXPECT_STREQ(L"abxx", _wcsncpy(szTarget, L"ab", 2));
    EXPECT_EQ(std::wstring(L"ab\0\0", 4), std::wstring(_wcsncpy(szTarget, L"ab", 4), 4));
}
