#include "Common/Utf8.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cstdint>
#include <string>

namespace
{

constexpr wchar_t UNTOUCHED = 0x1234;

std::string PrintedBy(const wchar_t* szText)
{
    testing::internal::CaptureStdout();
    const int iPrinted = _wprintf(szText, 1, "ignored");
    std::string strPrinted = testing::internal::GetCapturedStdout();
    EXPECT_EQ(static_cast<int>(strPrinted.size()), iPrinted);
    return strPrinted;
}

} // namespace

// On a failure, what stands before the bytes that do not decode stays written.
TEST(Utf8, DecodesUpToTheBound)
{
    struct
    {
        std::string strBytes;
        int iLastByte;
        int iResult;
        std::wstring strText;
    } const cases[] = {
        {"\xE5\xBC\xA0", 2, 1, L"张"},
        {"\xE5\xBC\xA0", 1, -201, L""},
        {"\xC3\xA4", 1, 1, L"ä"},
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
    for (const auto& item : cases)
    {
        wchar_t szTarget[10];
        std::fill(std::begin(szTarget), std::end(szTarget), UNTOUCHED);
        EXPECT_EQ(item.iResult, Utf82Unicode(item.strBytes.c_str(), szTarget, item.iLastByte));
        EXPECT_EQ(item.strText,
                  std::wstring(szTarget, std::find(szTarget, std::end(szTarget), UNTOUCHED)));
    }
}

TEST(Utf8, EncodesUpToTheBound)
{
    const std::wstring strText = {L'a', 0x10FFFF, static_cast<wchar_t>(0x80000041U), L'z'};
    char szTarget[20] = {};
    EXPECT_EQ(8, Unicode2Utf8(strText.c_str(), szTarget, INT32_MAX));
    EXPECT_STREQ("a\xEF\xBF\xBD\xEF\xBF\xBDz", szTarget);
    EXPECT_EQ(4, Unicode2Utf8(strText.c_str(), szTarget, 1));
    EXPECT_EQ(0, Unicode2Utf8(strText.c_str(), szTarget, -1));
}

TEST(Utf8, EveryUnitOfThePlaneComesBack)
{
    for (uint32_t uUnit = 1; uUnit <= 0xFFFF; ++uUnit)
    {
        const wchar_t szText[] = {static_cast<wchar_t>(uUnit), 0};
        char szBytes[4] = {};
        wchar_t szBack[4] = {};
        const int iBytes = _wcstombs(szBytes, szText, 1);
        ASSERT_EQ(uUnit < 0x80 ? 1 : uUnit < 0x800 ? 2 : 3, iBytes);
        ASSERT_EQ(1, _mbstowcs(szBack, szBytes, iBytes - 1));
        ASSERT_EQ(szText[0], szBack[0]);
    }
}

TEST(Utf8, PrintsTheFormatAsItStands)
{
    EXPECT_EQ("100%d %s %n \xE5\xBC\xA0\n", PrintedBy(L"100%d %s %n 张"));
    for (size_t uLength : {128U, 5000U})
    {
        std::string strExpected;
        for (size_t i = 0; i < uLength; ++i)
        {
            strExpected += "\xE5\xBC\xA0";
        }
        EXPECT_EQ(strExpected + "\n", PrintedBy(std::wstring(uLength, L'张').c_str()));
    }
}

TEST(Utf8, FormattedTextStaysBelowItsBuffer)
{
    wchar_t szTarget[1100];
    EXPECT_EQ(16, _u_wsprintf(szTarget, L"%s=%d张%c%05.1f", "\xE5\xBC\xA0", 42, 'x', 2.5));
    EXPECT_STREQ(L"张=42张x002.5", szTarget);
    EXPECT_EQ(-1, _u_wsprintf(szTarget, L"%1024d", 1));
    EXPECT_STREQ(L"张=42张x002.5", szTarget);
    EXPECT_EQ(1024, _u_wsprintf(szTarget, L"%1023d", 1));
    EXPECT_EQ(std::wstring(1022, L' ') + L'1', szTarget);
}
