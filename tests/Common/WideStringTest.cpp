#include "Common/WideString.h"

#include <gtest/gtest.h>

#include <climits>
#include <cstdint>
#include <cstring>
#include <string>
#include <vector>

namespace
{

constexpr wchar_t HIGHEST_UNIT = static_cast<wchar_t>(0xFFFFFFFFU);

int Sign(int iValue)
{
    return (iValue > 0) - (iValue < 0);
}

} // namespace

TEST(WideString, CopiesWithTheTerminatorAndIgnoresNull)
{
    wchar_t szTarget[4] = {L'x', L'x', L'x', L'x'};
    EXPECT_EQ(szTarget, _wcscpy(szTarget, L"ab"));
    EXPECT_EQ(0, std::memcmp(szTarget, L"ab\0x", sizeof(szTarget)));
    EXPECT_EQ(szTarget, _wcscpy(szTarget, nullptr));
    EXPECT_EQ(nullptr, _wcscpy(nullptr, L"ab"));
    EXPECT_STREQ(L"ab", szTarget);
}

TEST(WideString, CountedCopyFillsOrLeavesTheTerminatorOut)
{
    struct
    {
        const wchar_t* szSource;
        size_t uCount;
        std::wstring strExpected;
    } const cases[] = {
        {L"ab", 0, L"xxxxx"},
        {L"ab", 1, L"axxxx"},
        {L"ab", 2, L"abxxx"},
        {L"ab", 3, std::wstring(L"ab\0xx", 5)},
        {L"", 4, std::wstring(L"\0\0\0\0x", 5)},
    };
    for (const auto& item : cases)
    {
        wchar_t szTarget[] = L"xxxxx";
        EXPECT_EQ(szTarget, _wcsncpy(szTarget, item.szSource, item.uCount));
        EXPECT_EQ(item.strExpected, std::wstring(szTarget, 5)) << item.uCount;
    }
}

TEST(WideString, Appends)
{
    wchar_t szTarget[8] = L"ab";
    EXPECT_EQ(szTarget, _wcscat(szTarget, L"cd"));
    EXPECT_STREQ(L"abcd", _wcscat(szTarget, L""));
    EXPECT_EQ(4U, _wcslen(szTarget));
}

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
        {L"", L"", 0},
        {L"abc", L"abc", 0},
        {L"abc", L"abe", -2},
        {L"b", L"a", 1},
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
    EXPECT_EQ(-1, _wcsncmp(L"abc", L"abd", 3));
    // Nothing behind the terminators counts.
    EXPECT_EQ(0, _wcsncmp(L"ab\0c", L"ab\0d", 4));
}

TEST(WideString, CompareStringNamesTheOrder)
{
    EXPECT_EQ(1, _CompareString(0, 0, L"abc", 3, L"abd", 3));
    EXPECT_EQ(3, _CompareString(7, 9, L"abd", 3, L"abc", 3));
    EXPECT_EQ(2, _CompareString(0, 0, L"abc", 3, L"abc", 3));
    EXPECT_EQ(1, _CompareString(0, 0, L"ab", 2, L"abc", 3));
    EXPECT_EQ(3, _CompareString(0, 0, L"abc", 3, L"ab", 2));
    EXPECT_EQ(3, _CompareString(0, 0, L"a", 1, L"Z", 1));
    EXPECT_EQ(2, _CompareString(0, 0, L"", 0, L"", 0));
    EXPECT_EQ(2, _CompareString(0, 0, L"a", -1, L"b", -1));
}

TEST(WideString, Finds)
{
    const wchar_t szText[] = L"aab张b";
    EXPECT_EQ(szText + 1, _wcsstr(szText, L"ab"));
    EXPECT_EQ(szText + 3, _wcsstr(szText, L"张b"));
    EXPECT_EQ(szText, _wcsstr(szText, L""));
    EXPECT_EQ(nullptr, _wcsstr(szText, L"ba"));
    EXPECT_EQ(nullptr, _wcsstr(szText, L"aab张bb"));
    EXPECT_EQ(nullptr, _wcsstr(nullptr, L"a"));
    EXPECT_EQ(nullptr, _wcsstr(szText, nullptr));
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
    EXPECT_EQ(szBytes, strupr(szBytes));
    EXPECT_STREQ("AZ1 \xE5\xBC\xA0Z", szBytes);
}

TEST(WideString, CopiesBytesForwardWhateverOverlaps)
{
    constexpr int BYTES = 24;
    for (int iSource = 0; iSource < BYTES; ++iSource)
    {
        for (int iTarget = 0; iTarget < BYTES; ++iTarget)
        {
            const int iSize = BYTES - (iSource > iTarget ? iSource : iTarget);
            char szActual[BYTES];
            char szExpected[BYTES];
            for (int i = 0; i < BYTES; ++i)
            {
                szActual[i] = szExpected[i] = static_cast<char>('a' + i);
            }
            for (int i = 0; i < iSize; ++i)
            {
                szExpected[iTarget + i] = szExpected[iSource + i];
            }
            EXPECT_EQ(szActual + iTarget,
                      _memcpy(szActual + iTarget, szActual + iSource, static_cast<size_t>(iSize)));
            EXPECT_EQ(std::string(szExpected, BYTES), std::string(szActual, BYTES))
                << iSource << " to " << iTarget;
        }
    }
    char cByte = 'a';
    EXPECT_EQ(nullptr, _memcpy(nullptr, &cByte, 1));
    EXPECT_EQ(nullptr, _memcpy(&cByte, nullptr, 1));
    EXPECT_EQ('a', cByte);
}

TEST(WideString, OrderHoldsForAllPairsOfUnits)
{
    const std::vector<uint32_t> vUnits = {1, 'A', 'a', 0x4E2D, 0xFFFF, 0x10FFFF, 0x7FFFFFFF};
    for (uint32_t uLeft : vUnits)
    {
        for (uint32_t uRight : vUnits)
        {
            const wchar_t szLeft[] = {static_cast<wchar_t>(uLeft), 0};
            const wchar_t szRight[] = {static_cast<wchar_t>(uRight), 0};
            const int iOrder = (uLeft > uRight) - (uLeft < uRight);
            EXPECT_EQ(iOrder, Sign(_wcscmp(szLeft, szRight)));
            EXPECT_EQ(iOrder + 2, _CompareString(0, 0, szLeft, 1, szRight, 1));
        }
    }
}
