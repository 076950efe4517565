// Names into codes, pinyin keys and index characters, with the built table.

#include "tests/LocalizerImpl/LocalizerFixture.h"

#include "Common/CommonQsort.h"
#include "LocalizerImpl/NameFolding.h"
#include "LocalizerImpl/QVNumLocalizerManager.h"

#include <algorithm>
#include <fstream>
#include <vector>

namespace
{

using Manager = CQVLocalizerManager;

constexpr wchar_t UNTOUCHED = 0x7777;

struct tag_Name
{
    std::wstring strName;
    std::wstring strCodes; // as LocalizerFixture::Codes takes it
    std::wstring strKey;
};

std::wstring Repeat(const std::wstring& strText, int iCount)
{
    std::wstring strAll;
    while (iCount-- > 0)
    {
        strAll += strText;
    }
    return strAll;
}

const std::vector<tag_Name>& Names()
{
    static const std::vector<tag_Name> vNames = {
        {L"张三", L"张三", L"zhang 张san 三"},
        {L"Tom", L"tom", L"tom"},
        {L"Tom 2", L"tom?2", L"tom 2"},
        {L"李Lee", L"李lee", L"li 李lee"},
        {L"ABCDEFGHIJ", L"abcdefghij", L"abcdefghij"},
        {L"ABCDEFGHIJKL", L"abcdefghij", L"abcdefghijkl"},
        {L"0123456789#", L"0123456789", L"0123456789#"},
        {L"长-@[`{~", L"长??????", L"chang 长-@[`{~"},
        // Folding: by the first of several rows, and only in the first four characters.
        {L"三著矽衝", L"三著硅冲", L"san 三zhu 著gui 硅chong 冲"},
        {L"愛a愛a愛", L"爱a爱a愛", L"ai 爱aai 爱aai 愛"},
        {L"啊啊啊張張", L"啊啊啊张張", L"a 啊a 啊a 啊zhang 张zhang 張"},
        // Three bytes without a record: the bytes stand in the key.
        {L"한z", L"?z", L"\u00ED\u0095\u009Cz"},
        {L"\u0800\uFFFF、", L"???", L"\u00E0\u00A0\u0080\u00EF\u00BF\u00BF\u00E3\u0080\u0081"},
        // Two bytes: one other character, itself in the key; ASCII letters alone change case.
        {L"\u00C9a\u0080\u07FF张", L"?a??张", L"\u00C9a\u0080\u07FFzhang 张"},
        // No character up to U+FFFF: as if it were U+FFFD.
        {L"\x1F600z\x80000041", L"?z?", L"\u00EF\u00BF\u00BDz\u00EF\u00BF\u00BD"},
        // 30 characters of a name and of a key.
        {Repeat(L"张", 30), Repeat(L"张", 10), Repeat(L"zhang 张", 4) + L"zh"},
        {Repeat(L"x", 29) + L"张", Repeat(L"x", 10), Repeat(L"x", 29) + L"z"},
        {Repeat(L"\uFFFF", 31), Repeat(L"?", 10), Repeat(L"\u00EF\u00BF\u00BF", 10)},
        {Repeat(L"y", 31), Repeat(L"y", 10), Repeat(L"y", 30)},
    };
    return vNames;
}

// A record whose name ends where it ends: at 31 units without a terminator.
tag_ContactsStruct RecordOf(const std::wstring& strName)
{
    tag_ContactsStruct record = {};
    std::fill(std::begin(record.szName), std::end(record.szName), UNTOUCHED);
    std::fill(std::begin(record.szLocalizerKey), std::end(record.szLocalizerKey), UNTOUCHED);
    const size_t uCopied = std::min<size_t>(strName.size() + 1, 31);
    std::copy_n(strName.c_str(), uCopied, record.szName);
    return record;
}

// The units of a field whose last one is not written.
template <size_t N>
std::wstring Written(const wchar_t (&szField)[N])
{
    return {szField, N - 1};
}

std::wstring Padded(std::wstring strText, size_t uLength)
{
    strText.resize(uLength, L'\0');
    return strText;
}

class NameConversion : public LocalizerFixture
{
protected:
    // Pinyin tables that the process holds.
    int Mappings() const
    {
        std::ifstream maps("/proc/self/maps");
        int iCount = 0;
        for (std::string strLine; std::getline(maps, strLine);)
        {
            iCount += strLine.find(m_data.File("PyFileMappint.bin")) != std::string::npos ? 1 : 0;
        }
        return iCount;
    }

    // The typed text after a pick, and the result in front of it.
    std::wstring Pick(std::wstring strInput, int iPos, std::wstring strWord) const
    {
        std::vector<wchar_t> vOut(strInput.size() + strWord.size() + 2, UNTOUCHED);
        std::wstring strTyped = strInput;
        const int iRet =
            Manager::GetLocalizerString(strTyped.data(), iPos, strWord.data(), vOut.data());
        std::transform(strInput.begin(), strInput.end(), strInput.begin(),
                       [](wchar_t c) { return c >= L'A' && c <= L'Z' ? c + 32 : c; });
        EXPECT_EQ(strTyped, strInput) << "lowercased in place";
        EXPECT_EQ(vOut.back(), UNTOUCHED);
        return std::to_wstring(iRet) + L" " + vOut.data();
    }
};

} // namespace

TEST_F(NameConversion, MakesCodesAndKeysOfNames)
{
    for (const tag_Name& row : Names())
    {
        SCOPED_TRACE(testing::PrintToString(row.strName));
        const std::wstring strCodes = Padded(Codes(row.strCodes), 10);
        std::wstring strName = row.strName;
        wchar_t szCodes[11];
        std::fill(std::begin(szCodes), std::end(szCodes), UNTOUCHED);
        EXPECT_EQ(Manager::GetLocalizerChars(strName.data(), szCodes), 0);
        EXPECT_EQ(Written(szCodes), strCodes);
        std::fill(std::begin(szCodes), std::end(szCodes), UNTOUCHED);
        const long hMap = reinterpret_cast<long>(m_pMap);
        const CLogCapture log;
        EXPECT_EQ(Manager::GetLocalizerString(hMap, strName.data(), szCodes), 0);
        EXPECT_EQ(Written(szCodes), strCodes);
        EXPECT_EQ(szCodes[10], UNTOUCHED);
        EXPECT_EQ(strName, row.strName) << "only read";

        tag_ContactsStruct record = RecordOf(row.strName);
        tag_ContactsInfo info = {1, &record};
        EXPECT_EQ(Manager::GetLocalizerBatch(&info), 0);
        EXPECT_EQ(Written(record.szLocalizerKey), strCodes);
        EXPECT_EQ(record.szLocalizerKey[10], UNTOUCHED);
        const wchar_t last = record.szName[30];
        EXPECT_EQ(Manager::TransNameToPY(&record, 1), 0);
        EXPECT_EQ(Written(record.szName), Padded(row.strKey, 30));
        EXPECT_EQ(record.szName[30], last) << "the 31st unit is not written";
    }
    EXPECT_EQ(Mappings(), 1) << "the test's own";
}

TEST_F(NameConversion, SpellsUntilThirtyUnitsArePassed)
{
    std::wstring strName = std::wstring(29, L'Q') + L"长长";
    wchar_t szKey[LOC_SPELLING_BUFFER] = {};
    Common_Qsort sorter;
    EXPECT_EQ(Manager::TranslateChineseToPinyin(&sorter, m_pMap, strName.data(), szKey), 1);
    EXPECT_EQ(std::wstring(szKey), std::wstring(29, L'q') + L"chang 长");
    EXPECT_EQ(strName, std::wstring(29, L'q') + L"长长");
}

TEST_F(NameConversion, LeavesNamelessContactsTheirMarkOrTheirKey)
{
    std::vector<tag_ContactsStruct> vRecords = {RecordOf(L""), RecordOf(L"三"), RecordOf(L"")};
    tag_ContactsInfo info = {3, vRecords.data()};
    EXPECT_EQ(Manager::GetLocalizerBatch(&info), 0);
    EXPECT_EQ(vRecords[2].szLocalizerKey[0], UNTOUCHED);
    EXPECT_EQ(vRecords[1].szLocalizerKey[0], HanZi(L'三'));
    EXPECT_EQ(Manager::TransNameToPY(vRecords.data(), 0), 0);
    EXPECT_EQ(Manager::TransNameToPY(vRecords.data(), -1), 0);
    EXPECT_EQ(vRecords[0].szName[0], 0);
    EXPECT_EQ(Manager::TransNameToPY(vRecords.data(), 2), 0);
    EXPECT_EQ(vRecords[0].szName[0], 0x7FFFFFFF);
    EXPECT_EQ(vRecords[2].szName[0], 0) << "behind the count";

    wchar_t szEmpty[] = L"";
    wchar_t szCodes[] = L"0123456789";
    EXPECT_EQ(Manager::GetLocalizerChars(szEmpty, szCodes), 0);
    EXPECT_STREQ(szCodes, L"0123456789");
    EXPECT_EQ(Manager::GetLocalizerString(reinterpret_cast<long>(m_pMap), szEmpty, szCodes), 0);
    EXPECT_EQ(Written(szCodes), std::wstring(10, L'\0'));
}

TEST_F(NameConversion, WritesItsLines)
{
    wchar_t szName[] = L"T2";
    wchar_t szCodes[11] = {};
    const std::string strCall = "CQVLocalizerManager::GetLocalizerString the input mapping ";
    {
        const CLogCapture log;
        Manager::GetLocalizerChars(szName, szCodes);
        const tag_LogLine digit = {DEBUG_LINE, "QV_Localize",
                                   "QV_Contacts: TranslateNameToLocal the char is digital: 2 , the "
                                   "localize char is 0x5a02"};
        EXPECT_EQ(log.Lines(), std::vector<tag_LogLine>{digit});
    }
    for (const long hMap : {0L, -1L})
    {
        const CLogCapture log;
        EXPECT_EQ(Manager::GetLocalizerString(hMap, szName, szCodes), -1005);
        const std::vector<tag_LogLine> vExpected = {
            {ERROR_LINE, "QV_Localize", strCall + std::to_string(hMap) + "!"},
            {ERROR_LINE, "QV_Localize", strCall + "is wrong!"}};
        EXPECT_EQ(log.Lines(), vExpected);
    }
    const CLogCapture log;
    const long hMap = reinterpret_cast<long>(m_pMap);
    EXPECT_EQ(Manager::GetLocalizerString(hMap, nullptr, szCodes), -1005);
    EXPECT_EQ(Manager::GetLocalizerString(hMap, szName, nullptr), -1005);
    EXPECT_EQ(log.Count(ERROR_LINE, strCall + std::to_string(hMap) + "!"), 2);
    EXPECT_EQ(log.Count(ERROR_LINE, strCall + "is wrong!"), 2);
}

TEST_F(NameConversion, TellsWhatIsMissing)
{
    wchar_t szText[20] = L"Ab";
    tag_ContactsStruct record = RecordOf(L"Ab");
    tag_ContactsInfo info = {1, &record};
    EXPECT_EQ(Manager::GetLocalizerChars(nullptr, szText), -1005);
    EXPECT_EQ(Manager::GetLocalizerChars(szText, nullptr), -1005);
    EXPECT_EQ(Manager::GetLocalizerBatch(nullptr), -1005);
    EXPECT_EQ(Manager::TransNameToPY(nullptr, 1), -1005);
    EXPECT_EQ(Manager::GetLocalizerString(nullptr, 1, szText, szText), -1005);
    EXPECT_EQ(Manager::GetLocalizerString(szText, 1, nullptr, szText), -1005);
    RemoveTable();
    const CLogCapture log;
    wchar_t szOut[20] = {UNTOUCHED};
    EXPECT_EQ(Manager::GetLocalizerChars(szText, szOut), -1);
    EXPECT_EQ(Manager::GetLocalizerBatch(&info), -1000);
    EXPECT_EQ(Manager::TransNameToPY(&record, 1), -1000);
    EXPECT_EQ(Manager::GetLocalizerString(szText, 1, szText, szOut), -1000);
    EXPECT_EQ(szOut[0], UNTOUCHED);
    EXPECT_STREQ(szText, L"Ab");
    EXPECT_STREQ(record.szName, L"Ab");
    EXPECT_EQ(record.szLocalizerKey[0], UNTOUCHED);
    // An existing mapping serves on.
    EXPECT_EQ(Manager::GetLocalizerString(reinterpret_cast<long>(m_pMap), szText, szOut), 0);
    EXPECT_EQ(szOut[0], 0x4F00);
}

TEST_F(NameConversion, PutsAPickedCharacterInPlaceOfItsLetters)
{
    EXPECT_EQ(Pick(L"zhangs", 6, L"三"), L"0 ZHANG三");
    EXPECT_EQ(Pick(L"ZhangSa", 7, L"三"), L"0 ZHANG三") << "what follows the letter goes";
    EXPECT_EQ(Pick(L"sss", 2, L"三"), L"0 S三") << "the last one before the position";
    EXPECT_EQ(Pick(L"sss", 99, L"三"), L"0 SS三");
    EXPECT_EQ(Pick(L"lic", 3, L"长"), L"0 LI长") << "the first reading";
    EXPECT_EQ(Pick(L"liz", 3, L"长"), L"0 LI长") << "the second one";
    EXPECT_EQ(Pick(L"Zhangs", 5, L"三"), L"0 zhangs") << "no letter fits";
    EXPECT_EQ(Pick(L"S", 0, L"三"), L"0 s");
    EXPECT_EQ(Pick(L"S", -1, L"三"), L"0 s");
    EXPECT_EQ(Pick(L"", 0, L"三"), L"0 ");
    EXPECT_EQ(Pick(L"Li", 2, L"한"), L"-1000 li") << "not in the table";
    EXPECT_EQ(Pick(L"Ss", 2, L"三三"), L"-1000 ss");
    EXPECT_EQ(Pick(L"Li", 2, L"#"), L"0 LI#") << "no Chinese character";
    EXPECT_EQ(Pick(L"Li", 1, L"abc"), L"0 LIABC");
    EXPECT_EQ(Pick(L"Li", 2, L""), L"0 LI");
    EXPECT_EQ(Pick(L"L", 1, L"abcdefghijklmnopqrstuvw"), L"0 LABCDEFGHI")
        << "what its buffer holds";
    EXPECT_EQ(Mappings(), 1) << "the test's own";
}

TEST_F(NameConversion, FindsTheIndexCharacterOfACode)
{
    const struct
    {
        wchar_t code;
        wchar_t expected;
    } ROWS[] = {{0x4F00, L'A'},
                {0x4F19, L'Z'},
                {0x14F01, L'B'},
                {0x4F1A, L'#'},
                {0x5000, L'#'},
                {0x5A05, L'#'},
                {0, L'#'},
                {0x4C3E, L'#'},
                {0x0FFF, L'#'},
                {HanZi(L'长'), L'C'},
                {HanZi(L'三') + 0x10000, L'S'}};
    wchar_t szOut[] = {UNTOUCHED, UNTOUCHED};
    for (const auto& row : ROWS)
    {
        Manager::GetFirstWord(m_pMap, row.code, szOut);
        EXPECT_EQ(szOut[0], row.expected) << std::hex << static_cast<unsigned>(row.code);
    }
    EXPECT_EQ(szOut[1], UNTOUCHED) << "one character";
    std::vector<PYOFWORDS> vTable(1);
    for (const char cFirst : {'\0', 'A', '{'})
    {
        vTable[0].szPinyin[0][0] = cFirst;
        Manager::GetFirstWord(vTable.data(), 0x1000, szOut);
        EXPECT_EQ(szOut[0], 0) << cFirst;
    }
}

TEST_F(NameConversion, FindsTheIndexCharacterOfATime)
{
    CQVNumLocalizerManager atZero(1); // its present is 0
    constexpr long long DAYS_30 = 2592000000;
    const struct
    {
        long long llAge;
        wchar_t expected;
    } ROWS[] = {{0, L'1'},           {-1, L'1'},
                {INT64_MAX, L'5'},   {DAYS_30 - 1, L'1'},
                {DAYS_30, L'2'},     {3 * DAYS_30 - 1, L'2'},
                {3 * DAYS_30, L'3'}, {6 * DAYS_30 - 1, L'3'},
                {6 * DAYS_30, L'4'}, {12 * DAYS_30 - 1, L'4'},
                {12 * DAYS_30, L'5'}};
    for (const auto& row : ROWS)
    {
        wchar_t szOut[] = {UNTOUCHED, UNTOUCHED};
        atZero.GetFirstWord(-row.llAge, szOut);
        EXPECT_EQ(szOut[0], row.expected) << row.llAge;
        EXPECT_EQ(szOut[1], UNTOUCHED);
    }
    atZero.GetFirstWord(0, nullptr);
}

TEST(NameFolding, IsTheFirstRowOfTheTable)
{
    const std::wstring strTraditional = g_szTraditional;
    const std::wstring strSimplified = g_szSimplified;
    ASSERT_EQ(strTraditional.size(), 3755U);
    ASSERT_EQ(strSimplified.size(), 3755U);
    for (wchar_t unit = 1; unit <= 0xFFFF; ++unit)
    {
        const size_t uRow = strTraditional.find(unit);
        wchar_t szText[] = {unit, 0};
        Ft2Jt(szText);
        ASSERT_EQ(szText[0], uRow == std::wstring::npos ? unit : strSimplified[uRow])
            << std::hex << static_cast<unsigned>(unit);
        ASSERT_EQ(szText[1], 0);
    }
    wchar_t szLong[] = L"\x1611B愛愛愛愛";
    Ft2Jt(szLong);
    EXPECT_STREQ(szLong, L"\x1611B爱爱爱愛");
    Ft2Jt(nullptr);
}

TEST(SubString, CopiesOnlyRangesInsideTheText)
{
    const struct
    {
        int iFrom;
        int iTo;
        const wchar_t* szExpected;
    } ROWS[] = {{0, 4, L"abcd--"}, {1, 3, L"bc----"}, {2, 2, L"------"}, {-1, 2, L"------"},
                {3, 2, L"------"}, {0, 5, L"------"}, {4, 4, L"------"}};
    for (const auto& row : ROWS)
    {
        wchar_t szTarget[] = L"------";
        EXPECT_EQ(Manager::SubString(L"abcd", 4, szTarget, row.iFrom, row.iTo), 1);
        EXPECT_STREQ(szTarget, row.szExpected) << row.iFrom << ".." << row.iTo;
    }
    wchar_t szTarget[] = L"-";
    EXPECT_EQ(Manager::SubString(nullptr, 1, szTarget, 0, 1), 1);
    EXPECT_EQ(Manager::SubString(L"a", 1, nullptr, 0, 1), 1);
    EXPECT_STREQ(szTarget, L"-");
}
