#include "Common/Utf8.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cstdint>
#include <memory>
#include <random>
#include <string>

namespace
{

constexpr int ROOM = 64;
constexpr wchar_t UNTOUCHED = 0x1234;

// What a decoder is asked and what it must give; on a failure strText is what stays written.
struct DecodeCase
{
    std::string strBytes;
    int iLastByte;
    int iResult;
    std::wstring strText;
};

// Decodes into a buffer that shows how many units were written.
std::wstring Decoded(const DecodeCase& item, int& iResult)
{
    wchar_t szTarget[ROOM];
    std::fill(szTarget, szTarget + ROOM, UNTOUCHED);
    iResult = Utf82Unicode(item.strBytes.c_str(), szTarget, item.iLastByte);
    return {szTarget, std::find(szTarget, szTarget + ROOM, UNTOUCHED)};
}

std::string Encoded(const std::wstring& strText, int iLastUnit)
{
    std::string strBytes(strText.size() * 3 + 1, '!');
    const int iBytes = Unicode2Utf8(strText.c_str(), strBytes.data(), iLastUnit);
    EXPECT_EQ(std::string(strBytes.size() - static_cast<size_t>(iBytes), '!'),
              strBytes.substr(static_cast<size_t>(iBytes)));
    return strBytes.substr(0, static_cast<size_t>(iBytes));
}

std::string PrintedBy(const wchar_t* szText)
{
    testing::internal::CaptureStdout();
    const int iPrinted = _wprintf(szText, 1, "ignored");
    std::string strPrinted = testing::internal::GetCapturedStdout();
    EXPECT_EQ(static_cast<int>(strPrinted.size()), iPrinted);
    return strPrinted;
}

} // namespace

TEST(Utf8, DecodesUpToTheBound)
{
    const DecodeCase cases[] = {
        {"\xE5\xBC\xA0", 7, 1, L"张"},
        {"\xE5\xBC\xA0", 2, 1, L"张"},
        {"\xE5\xBC\xA0", 1, -201, L""},
        {"\xE5\xBC\xA0", 0, -201, L""},
        {"\xC3\xA4", 1, 1, L"ä"},
        {"\xC3\xA4", 0, -201, L""},
        {"zhang", 1, 2, L"zh"},
        {"zhang", 0, 1, L"z"},
        {"zhang", -1, 0, L""},
        {"zhang", INT32_MAX, 5, L"zhang"},
        {"", 10, 0, L""},
        {"a\xE5\xBC\xA0z", 3, 2, L"a张"},
        {"a\xE5\xBC\xA0z", 2, -201, L"a"},
        {"\x7F\xDF\xBF\xEF\xBF\xBF", 10, 3, L"\x7F\x7FF\xFFFF"},
    };
    for (const DecodeCase& item : cases)
    {
        int iResult = 0;
        EXPECT_EQ(item.strText, Decoded(item, iResult)) << item.strBytes << ' ' << item.iLastByte;
        EXPECT_EQ(item.iResult, iResult) << item.strBytes << ' ' << item.iLastByte;
    }
}

TEST(Utf8, KeepsWhatStandsBeforeBytesThatDoNotDecode)
{
    const char* const tails[] = {
        "\x80",             // continuation without a lead
        "\xBF",             //
        "\xF0\x9F\x98\x80", // four bytes
        "\xF8\x88\x80\x80", // five
        "\xFF",             //
        "\xC3",             // cut
        "\xC3\x28",         // no continuation
        "\xC3\xC3\xA4",     //
        "\xE5",             //
        "\xE5\xBC",         //
        "\xE5\xBC\x41",     //
        "\xE5\x41\xA0",     //
    };
    for (const char* szTail : tails)
    {
        int iResult = 0;
        EXPECT_EQ(L"ab", Decoded({std::string("ab") + szTail, 30, 0, L""}, iResult));
        EXPECT_EQ(UTF8_ERR_INVALID, iResult);
    }
}

TEST(Utf8, DecodesOverlongFormsAndSurrogates)
{
    int iResult = 0;
    EXPECT_EQ(std::wstring(L"A"), Decoded({"\xC1\x81", 5, 0, L""}, iResult));
    EXPECT_EQ(std::wstring(1, L'\0') + L"A",
              Decoded({"\xE0\x80\x80\xE0\x81\x81", 5, 0, L""}, iResult));
    EXPECT_EQ(2, iResult);
    EXPECT_EQ(std::wstring(1, static_cast<wchar_t>(0xD800)),
              Decoded({"\xED\xA0\x80", 5, 0, L""}, iResult));
}

TEST(Utf8, EncodesUpToTheBound)
{
    struct
    {
        std::wstring strText;
        int iLastUnit;
        std::string strBytes;
    } const cases[] = {
        {L"abc", 1, "ab"},
        {L"abc", 3, "abc"},
        {L"abc", 0, "a"},
        {L"abc", -1, ""},
        {L"abc", INT32_MAX, "abc"},
        {L"", 3, ""},
        {L"中", 0, "\xE4\xB8\xAD"},
        {L"\x7F\x80\x7FF\x800\xFFFF", 9, "\x7F\xC2\x80\xDF\xBF\xE0\xA0\x80\xEF\xBF\xBF"},
        {L"a\x10000\x10FFFFz", 9, "a\xEF\xBF\xBD\xEF\xBF\xBDz"},
        {{static_cast<wchar_t>(-1), static_cast<wchar_t>(0x80000041U), 0x7FFFFFFF},
         9,
         "\xEF\xBF\xBD\xEF\xBF\xBD\xEF\xBF\xBD"},
    };
    for (const auto& item : cases)
    {
        EXPECT_EQ(item.strBytes, Encoded(item.strText, item.iLastUnit)) << item.iLastUnit;
    }
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

// A string ends where its bytes end: nothing behind the terminator or the bound is read, which
// the address sanitizer sees.
TEST(Utf8, RandomBytesStayInsideTheirBuffers)
{
    std::mt19937 random(71);
    const std::string strAlphabet = "a\x80\xBF\xC3\xDF\xE5\xEF\xF0\xFF";
    for (int iRound = 0; iRound < 20000; ++iRound)
    {
        const size_t uLength = random() % 8;
        auto pBytes = std::make_unique<char[]>(uLength + 1);
        for (size_t i = 0; i < uLength; ++i)
        {
            pBytes[i] = strAlphabet[random() % strAlphabet.size()];
        }
        const int iLastByte = static_cast<int>(random() % 8);
        auto pText =
            std::make_unique<wchar_t[]>(std::min(uLength, static_cast<size_t>(iLastByte) + 1));
        const int iResult = Utf82Unicode(pBytes.get(), pText.get(), iLastByte);
        EXPECT_TRUE(iResult == UTF8_ERR_INVALID || iResult <= static_cast<int>(uLength));
    }
}

TEST(Utf8, NullConvertsToNothing)
{
    wchar_t cUnit = 7;
    char cByte = 7;
    EXPECT_EQ(0, Utf82Unicode(nullptr, &cUnit, 5));
    EXPECT_EQ(0, Utf82Unicode("a", nullptr, 5));
    EXPECT_EQ(0, Unicode2Utf8(nullptr, &cByte, 5));
    EXPECT_EQ(0, Unicode2Utf8(L"a", nullptr, 5));
    EXPECT_EQ(7, cUnit);
    EXPECT_EQ(7, cByte);
}

TEST(Utf8, PrintsTheFormatAsItStands)
{
    EXPECT_EQ("\n", PrintedBy(L""));
    EXPECT_EQ("\n", PrintedBy(nullptr));
    EXPECT_EQ("100%d %s %n \xE5\xBC\xA0\n", PrintedBy(L"100%d %s %n 张"));
    for (size_t uLength : {127U, 128U, 129U, 256U, 5000U})
    {
        std::string strExpected;
        for (size_t i = 0; i < uLength; ++i)
        {
            strExpected += "\xE5\xBC\xA0";
        }
        EXPECT_EQ(strExpected + "\n", PrintedBy(std::wstring(uLength, L'张').c_str()));
    }
}

TEST(Utf8, FormatsNarrowArguments)
{
    wchar_t szTarget[1100];
    EXPECT_EQ(16, _u_wsprintf(szTarget, L"%s=%d张%c%05.1f", "\xE5\xBC\xA0", 42, 'x', 2.5));
    EXPECT_STREQ(L"张=42张x002.5", szTarget);
    EXPECT_EQ(1, _u_wsprintf(szTarget, L""));
    EXPECT_STREQ(L"", szTarget);
    EXPECT_EQ(-1, _u_wsprintf(nullptr, L"a"));
    EXPECT_EQ(-1, _u_wsprintf(szTarget, nullptr));
}

TEST(Utf8, FormattedTextStaysBelowItsBuffer)
{
    wchar_t szTarget[1100] = L"old";
    EXPECT_EQ(-1, _u_wsprintf(szTarget, L"%1024d", 1));
    EXPECT_EQ(-1, _u_wsprintf(szTarget, std::wstring(2000, L'张').c_str()));
    EXPECT_STREQ(L"old", szTarget);
    EXPECT_EQ(1024, _u_wsprintf(szTarget, L"%1023d", 1));
    EXPECT_EQ(std::wstring(1022, L' ') + L'1', szTarget);
    // A format longer than the text that comes of it.
    EXPECT_EQ(3, _u_wsprintf(szTarget, (L"%." + std::wstring(3000, L'0') + L"2s").c_str(), "abc"));
    EXPECT_STREQ(L"ab", szTarget);
}

TEST(Utf8, FormattedTextEndsBeforeWhatDoesNotDecode)
{
    wchar_t szTarget[20] = L"xxxxxxxxxxxx";
    EXPECT_EQ(8, _u_wsprintf(szTarget, L"ab%sc", "\xF0\x9F\x98\x80"));
    EXPECT_STREQ(L"ab", szTarget);
}
