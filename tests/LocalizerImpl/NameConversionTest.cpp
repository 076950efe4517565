// Names into codes, pinyin keys and index characters, with the built table.

#include "LocalizerImpl/NameFolding.h"
#include "LocalizerImpl/QVNumLocalizerManager.h"
#include "tests/LocalizerImpl/LocalizerFixture.h"

#include <algorithm>
#include <tuple>

namespace
{

using Manager = CQVLocalizerManager;
using NameConversion = LocalizerFixture;

constexpr wchar_t UNTOUCHED = 0x7777;

std::wstring Repeat(const std::wstring& strText, int iCount)
{
    return iCount > 0 ? strText + Repeat(strText, iCount - 1) : L"";
}

// Names, their codes as LocalizerFixture::Codes takes them, and their keys.
const std::tuple<std::wstring, std::wstring, std::wstring> NAMES[] = {
    {L"Tom 2", L"tom?2", L"tom 2"},
    {L"李Lee", L"李lee", L"li 李lee"},
    {L"一", L"一", L"yi 一"}, // the first record
    {L"长-@[`{~", L"长??????", L"chang 长-@[`{~"},
    // Folding: by the first of several rows, and only in the first four characters.
    {L"三著矽衝", L"三著硅冲", L"san 三zhu 著gui 硅chong 冲"},
    {L"啊啊啊張張", L"啊啊啊张張", L"a 啊a 啊a 啊zhang 张zhang 張"},
    // Three bytes without a record: the bytes stand in the key.
    {L"한z", L"?z", L"\u00ED\u0095\u009Cz"},
    // Two bytes: one other character, itself in the key; ASCII letters alone change case.
    {L"\u00C9a\u0080\u07FF张", L"?a??张", L"\u00C9a\u0080\u07FFzhang 张"},
    // No character up to U+FFFF: as if it were U+FFFD.
    {L"\x1F600z\x80000041", L"?z?", L"\u00EF\u00BF\u00BDz\u00EF\u00BF\u00BD"},
    // 30 characters of a name and of a key.
    {Repeat(L"张", 30), Repeat(L"张", 10), Repeat(L"zhang 张", 4) + L"zh"},
    {Repeat(L"x", 29) + L"张", Repeat(L"x", 10), Repeat(L"x", 29) + L"z"},
    {Repeat(L"y", 31), Repeat(L"y", 10), Repeat(L"y", 30)},
};

// A record whose name ends where it ends: at 31 units without a terminator.
tag_ContactsStruct RecordOf(const std::wstring& strName)
{
    tag_ContactsStruct record = {};
    std::fill(std::begin(record.szName), std::end(record.szName), UNTOUCHED);
    std::fill(std::begin(record.szLocalizerKey), std::end(record.szLocalizerKey), UNTOUCHED);
    std::copy_n(strName.c_str(), std::min<size_t>(strName.size() + 1, 31), record.szName);
    return record;
}

std::wstring Padded(std::wstring strText, size_t uLength)
{
    strText.resize(uLength, L'\0');
    return strText;
}

// The typed text after a pick, and the result in front of it.
std::wstring Pick(std::wstring strInput, int iPos, std::wstring strWord)
{
    wchar_t szOut[40] = {};
    const int iRet = Manager::GetLocalizerString(strInput.data(), iPos, strWord.data(), szOut);
    return std::to_wstring(iRet) + L" " + szOut;
}

} // namespace

TEST_F(NameConversion, MakesCodesAndKeysOfNames)
{
    for (const auto& [strName, strCodeText, strKey] : NAMES)
    {
        SCOPED_TRACE(testing::PrintToString(strName));
        const std::wstring strCodes = Padded(Codes(strCodeText), 10);
        std::wstring strGiven = strName;
        wchar_t szCodes[11] = {};
        const long hMap = reinterpret_cast<long>(m_pMap);
        EXPECT_EQ(Manager::GetLocalizerString(hMap, strGiven.data(), szCodes), 0);
        EXPECT_EQ(std::wstring(szCodes, 10), strCodes);
        EXPECT_EQ(strGiven, strName) << "only read";
        tag_ContactsStruct record = RecordOf(strName);
        tag_ContactsInfo info = {1, &record};
        EXPECT_EQ(Manager::GetLocalizerBatch(&info), 0);
        EXPECT_EQ(std::wstring(record.szLocalizerKey, 11), strCodes + UNTOUCHED);
        const wchar_t last = record.szName[30];
        EXPECT_EQ(Manager::TransNameToPY(&record, 1), 0);
        EXPECT_EQ(std::wstring(record.szName, 31), Padded(strKey, 30) + last);
    }
    wchar_t szName[] = L"T2";
    wchar_t szCodes[11] = {};
    const std::string strCall = "CQVLocalizerManager::GetLocalizerString the input mapping ";
    const CLogCapture log;
    Manager::GetLocalizerChars(szName, szCodes);
    EXPECT_EQ(Manager::GetLocalizerString(-1, szName, szCodes), -1005);
    EXPECT_EQ(log.Texts(DEBUG_LINE), Lines{"QV_Contacts: TranslateNameToLocal the char is digital: "
                                           "2 , the localize char is 0x5a02"});
    EXPECT_EQ(log.Texts(ERROR_LINE), (Lines{strCall + "-1!", strCall + "is wrong!"}));
    for (int i = 0; i < 3; ++i) // without one of their arguments
    {
        PYOFWORDS* pMap = i == 0 ? nullptr : m_pMap;
        wchar_t* pName = i == 1 ? nullptr : szName;
        wchar_t* pOut = i == 2 ? nullptr : szCodes;
        EXPECT_EQ(Manager::TranslateNameToLocal(pMap, pName, pOut), 1);
        EXPECT_EQ(Manager::TranslateChineseToPinyin(nullptr, pMap, pName, pOut), 1);
        EXPECT_EQ(Manager::GetLocalizerString(i == 0 ? nullptr : szName, 1, pName, pOut),
                  LOC_ERR_PARAM);
    }
    RemoveTable();
    tag_ContactsInfo nobody = {0, nullptr};
    tag_ContactsStruct record = {};
    EXPECT_EQ(Manager::GetLocalizerChars(szName, szCodes), -1);
    EXPECT_EQ(Manager::GetLocalizerBatch(&nobody), -1000);
    EXPECT_EQ(Manager::TransNameToPY(&record, 1), -1000);
    EXPECT_EQ(Pick(L"yi", 2, L"一"), L"-1000 ");
}

TEST_F(NameConversion, PutsAPickedCharacterInPlaceOfItsLetters)
{
    EXPECT_EQ(Pick(L"ZhangSa", 7, L"三"), L"0 ZHANG三") << "what follows the letter goes";
    EXPECT_EQ(Pick(L"sss", 2, L"三"), L"0 S三") << "the last one before the position";
    EXPECT_EQ(Pick(L"sss", 99, L"三"), L"0 SS三");
    EXPECT_EQ(Pick(L"sss", INT32_MIN, L"三"), L"0 sss") << "nothing is before it";
    EXPECT_EQ(Pick(L"yi", 2, L"一"), L"0 一") << "the first record";
    EXPECT_EQ(Pick(L"liz", 3, L"长"), L"0 LI长") << "the second reading";
    EXPECT_EQ(Pick(L"Zhangs", 5, L"三"), L"0 zhangs") << "no letter fits";
    EXPECT_EQ(Pick(L"Li", 2, L"한"), L"-1000 li") << "not in the table";
    EXPECT_EQ(Pick(L"Li", 2, L"三三"), L"-1000 li") << "two characters";
    EXPECT_EQ(Pick(L"Li", 1, L"abc"), L"0 LIABC") << "no Chinese character";
    EXPECT_EQ(Pick(L"Li", 1, L"abcdefghijk"), L"0 LIABCDEFGHI") << "nine bytes of it";
}

TEST_F(NameConversion, FindsTheIndexCharacterOfACodeOrATime)
{
    const std::pair<wchar_t, wchar_t> ROWS[] = {
        {0x4F00, L'A'}, {0x4F19, L'Z'}, {0x4F1A, L'#'}, {0x5000, L'#'},  {0x5A05, L'#'},
        {0, L'#'},      {0x4C3E, L'#'}, {0x0FFF, L'#'}, {0x14F01, L'B'}, {HanZi(L'长'), L'C'}};
    wchar_t szOut[] = {UNTOUCHED, UNTOUCHED};
    for (const auto& [code, expected] : ROWS)
    {
        Manager::GetFirstWord(m_pMap, code, szOut);
        EXPECT_EQ(std::wstring(szOut, 2), (std::wstring{expected, UNTOUCHED})) << std::hex << +code;
    }
    CQVNumLocalizerManager atZero(1); // its present is 0
    constexpr long long DAYS_30 = 2592000000;
    const long long FIRST_AGES[] = {INT64_MIN + 1, DAYS_30, 3 * DAYS_30, 6 * DAYS_30, 12 * DAYS_30};
    for (int i = 0; i < 5; ++i)
    {
        for (const long long llAge : {FIRST_AGES[i], i == 4 ? INT64_MAX : FIRST_AGES[i + 1] - 1})
        {
            atZero.GetFirstWord(-llAge, szOut);
            EXPECT_EQ(szOut[0], L'1' + static_cast<wchar_t>(i));
        }
    }
}

TEST(NameFolding, IsTheFirstRowOfTheTable)
{
    const std::wstring strTraditional = g_szTraditional;
    for (wchar_t unit = 1; unit <= 0xFFFF; ++unit)
    {
        const size_t uRow = strTraditional.find(unit);
        wchar_t szText[] = {unit, 0, L'張'};
        Ft2Jt(szText);
        ASSERT_EQ(szText[2], L'張') << "behind the end";
        ASSERT_EQ(szText[0], uRow == std::wstring::npos ? unit : g_szSimplified[uRow]);
    }
}
