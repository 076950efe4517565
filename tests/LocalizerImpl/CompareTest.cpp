// The search's operations called directly: one split against one name, the mask, the candidate
// characters, typed Chinese characters, and the place of a changed record.

#include "LocalizerImpl/QVNumLocalizerManager.h"
#include "LocalizerImpl/QVWordLocalizerManager.h"
#include "tests/LocalizerImpl/LocalizerFixture.h"
#include "tests/LocalizerImpl/SearchProbe.h"

#include <algorithm>
#include <random>
#include <tuple>
#include <vector>

namespace
{

using Manager = CQVLocalizerManager;
using WordProbe = CSearchProbe<CQVWordLocalizerManager>;

// What one comparison answers: whether it matched, iKeyLen and bAllFull.
using Compared = std::tuple<int, int, int>;

tag_LocalizerDetail DetailOf(const std::wstring& strCodes)
{
    tag_LocalizerDetail detail = {};
    std::copy(strCodes.begin(), strCodes.end(), detail.szLocalizerKey);
    return detail;
}

class Compare : public LocalizerFixture
{
protected:
    using Pieces = std::vector<std::wstring>; // first piece first

    Compared Do(Manager& matcher, const std::wstring& strCodes, Pieces vTexts, int iKeyLen = 0,
                int bAllFull = 0) const
    {
        android::Vector<wchar_t*> vPieces;
        for (auto pText = vTexts.rbegin(); pText != vTexts.rend(); ++pText)
        {
            vPieces.push(pText->data());
        }
        tag_LocalizerDetail detail = DetailOf(strCodes);
        const int iMatch = matcher.DoCompare(m_pMap, &detail, vPieces, iKeyLen, bAllFull);
        return {iMatch, iKeyLen, bAllFull};
    }

    // The comparison as it is described, on the rest of a name.
    Compared Plain(Manager& matcher, bool bAnywhere, const std::wstring& strCodes,
                   const Pieces& vTexts) const
    {
        int bAllFull = 1;
        bool bFits = vTexts.size() <= strCodes.size();
        for (size_t i = 0; bFits && i < vTexts.size(); ++i)
        {
            std::wstring strPiece = vTexts[i];
            const wchar_t code = strCodes[i];
            const auto uCode = static_cast<unsigned short>(code);
            _mask_type mask = {};
            int bFull = 0;
            if (Manager::IsHanZi(uCode))
            {
                bFits = matcher.CmpChineseWord(m_pMap, code, m_pMap[uCode - 0x1000],
                                               strPiece.data(), &mask, 0, bFull) == 1;
                bAllFull = bAllFull & bFull;
                continue;
            }
            bFits =
                (Manager::IsAlpha(uCode)    ? matcher.CmpEnglishWords(uCode, strPiece.data())
                 : Manager::IsDigtal(uCode) ? matcher.CmpDigitalWord(uCode, strPiece.data())
                                            : matcher.CmpOtherWords(uCode, strPiece.data())) == 1;
        }
        if (bFits)
        {
            return {1, static_cast<int>(strCodes.size()), bAllFull};
        }
        return bAnywhere && strCodes.size() >= 2 && vTexts.size() <= strCodes.size() - 1
                   ? Plain(matcher, bAnywhere, strCodes.substr(1), vTexts)
                   : Compared{0, 0, 0};
    }
};

} // namespace

TEST_F(Compare, LaysPiecesOnANameFromTheLeft)
{
    const struct
    {
        const wchar_t* szName; // as Codes takes it
        Pieces vPieces;
        Compared expected; // when runs begin anywhere
        bool bAtStart;     // also when they begin at the first character only
        Findings findings;
    } ROWS[] = {{L"张三", {L"zhan"}, {1, 2, 0}, true, {"gs", L"张"}},
                {L"张三", {L"zhang", L"s"}, {1, 2, 0}, true, {"a", L"三"}},
                {L"张三", {L"zhang", L"san"}, {1, 2, 1}, true, {"", L"三"}},
                {L"李张三", {L"z", L"s"}, {1, 2, 0}, false, {"a", L"三"}},
                {L"三三a", {L"san"}, {1, 3, 1}, true, {"s", L"三"}}, // the leftmost
                {L"长三", {L"z"}, {1, 2, 0}, true, {"hs", L"长"}},
                {L"tom", {L"t", L"o"}, {1, 3, 1}, true, {"m", L""}},
                {L"tom", {L"to"}, {0, 0, 0}, false, {}},
                {L"tom", {L"o"}, {1, 2, 1}, false, {"m", L""}},
                {L"张?三", {L"z", L"s"}, {0, 0, 0}, false, {}},
                {L"张?7三", {L"z", L"#", L"#"}, {1, 4, 0}, true, {"s", L""}},
                {L"a?", {L"a"}, {1, 2, 1}, true, {"#", L""}},
                {L"a7", {L"a"}, {1, 2, 1}, true, {"#", L""}},
                {L"三", {L"s", L"s"}, {0, 0, 0}, false, {}},
                {L"", {L"s"}, {0, 0, 0}, false, {}},
                {L"aaaaaaaaab", {L"a", L"b"}, {1, 2, 1}, false, {}}};
    for (const auto& row : ROWS)
    {
        SCOPED_TRACE(testing::PrintToString(std::wstring(row.szName)));
        WordProbe anywhere(1);
        const Findings findings = anywhere.Run(
            1, [&] { EXPECT_EQ(Do(anywhere, Codes(row.szName), row.vPieces), row.expected); });
        EXPECT_EQ(findings, row.findings);
        CQVWordLocalizerManager atStart(0);
        EXPECT_EQ(Do(atStart, Codes(row.szName), row.vPieces),
                  row.bAtStart ? row.expected : (Compared{0, 0, 0}));
    }
}

TEST_F(Compare, AnswersAsDescribedForAnyNameAndSplit)
{
    std::mt19937 rng(31);
    const std::wstring strNames = Codes(L"张长三a7?") + L"\x15000\x2";
    const Pieces vTexts = {L"z", L"zhang", L"chang", L"s", L"san", L"a",         L"#",
                           L"7", L"94264", L"2",     L"9", L"",    {strNames[0]}};
    for (int iRound = 0; iRound < 20000; ++iRound)
    {
        const int bAnywhere = static_cast<int>(rng() % 2);
        CQVWordLocalizerManager letters(bAnywhere);
        CQVNumLocalizerManager digits(bAnywhere);
        Manager& matcher = rng() % 2 == 0 ? static_cast<Manager&>(letters) : digits;
        std::wstring strCodes(rng() % 7, L'\0');
        std::generate(strCodes.begin(), strCodes.end(), [&] { return strNames[rng() % 8]; });
        Pieces vPieces(rng() % 4);
        std::generate(vPieces.begin(), vPieces.end(),
                      [&] { return vTexts[rng() % vTexts.size()]; });
        ASSERT_EQ(Do(matcher, strCodes, vPieces), Plain(matcher, bAnywhere != 0, strCodes, vPieces))
            << iRound;
    }
}

TEST_F(Compare, KeepsTheLengthThatItWasHandedUnlessAllIsWhole)
{
    CQVWordLocalizerManager matcher(1);
    EXPECT_EQ(Do(matcher, Codes(L"三"), {L"s"}, 7, 0), (Compared{1, 7, 0}));
    EXPECT_EQ(Do(matcher, Codes(L"三"), {L"san"}, 7, 0), (Compared{1, 1, 1}));
    EXPECT_EQ(Do(matcher, Codes(L"三"), {L"san"}, 7, 1), (Compared{1, 7, 1}));
    android::Vector<wchar_t*> vPieces;
    vPieces.push(nullptr);
    tag_LocalizerDetail detail = DetailOf(Codes(L"三"));
    int iKeyLen = 0;
    int bAllFull = 0;
    EXPECT_EQ(matcher.DoCompare(nullptr, &detail, vPieces, iKeyLen, bAllFull), 0);
    EXPECT_EQ(matcher.DoCompare(m_pMap, nullptr, vPieces, iKeyLen, bAllFull), 0);
    EXPECT_EQ(matcher.DoCompare(m_pMap, &detail, vPieces, iKeyLen, bAllFull), 0) << "a null piece";
}

TEST_F(Compare, AddsTheKeysOfACharacterToTheMask)
{
    const struct
    {
        wchar_t code;
        std::string strKeys;
    } ROWS[] = {{0x4F00, "a"}, {0x4F19, "z"},       {HanZi(L'长'), "cz"}, {0x5000, "#"},
                {0x5A00, "#"}, {0x5A09, "#"},       {0x15000, ""},        {0, ""},
                {0x4F1A, ""},  {HanZi(L'三'), "s"}, {0x5A0A, ""},         {0x14F01, "b"}};
    WordProbe probe;
    for (const auto& row : ROWS)
    {
        EXPECT_EQ(probe.Run(9, [&] { EXPECT_EQ(probe.CreateMaskWord(m_pMap, row.code), 1); }).first,
                  row.strKeys);
        EXPECT_EQ(probe.Run(1, [&] { probe.CreateCNWordMask(m_pMap, row.code); }).first,
                  Manager::IsAlpha(static_cast<unsigned short>(row.code)) ? "" : row.strKeys);
    }
    const auto ask = [&]
    {
        probe.CreateCNWordMask(m_pMap, 0x5000);
        probe.CreateCNWordMask(nullptr, HanZi(L'三'));
        EXPECT_EQ(probe.CreateMaskWord(nullptr, 0x4F00), 0);
        EXPECT_EQ(probe.CreateMaskWord(m_pMap, 0), 1);
    };
    EXPECT_EQ(probe.Run(9, ask).first, "#");
    EXPECT_EQ(probe.Run(10, ask).first, "") << "a full text clears what is there";
}

TEST_F(Compare, ListsCandidatesOnceUntilTheListIsFull)
{
    WordProbe probe;
    const auto insert = [&](wchar_t character, uint16_t nMatchLen)
    {
        CNWORDOUTPUT entry = {{character}, nMatchLen};
        probe.InsertCNWord(entry);
    };
    EXPECT_EQ(probe
                  .Run(1,
                       [&]
                       {
                           insert(L'三', 0);
                           insert(L'张', 2);
                           insert(L'李', 1);
                           insert(L'张', 1);
                       })
                  .second,
              L"张李");
    const auto fill = [&]
    {
        for (int i = 0; i < 25; ++i)
        {
            insert(L'A' + i, 1);
        }
    };
    EXPECT_EQ(probe.Run(1, fill).second, L"ABCDEFGHIJKLMNOPQRST");
}

TEST_F(Compare, TurnsTypedChineseCharactersIntoTheirCodes)
{
    CQVWordLocalizerManager matcher(1);
    std::wstring strInput = L"aZ7#* 한三張\x1F600愛";
    const std::wstring strExpected = L"aZ7#* 한" + Codes(L"三张") + L"\x1F600" + Codes(L"爱");
    matcher.ProcessInputCNWord(nullptr, strInput.data());
    EXPECT_EQ(strInput.back(), L'愛');
    matcher.ProcessInputCNWord(m_pMap, strInput.data());
    EXPECT_EQ(strInput, strExpected);
    matcher.ProcessInputCNWord(m_pMap, nullptr);
}

TEST_F(Compare, JudgesWhetherTheMatchedCharactersAreLettersOrOthers)
{
    const struct
    {
        const wchar_t* szName;
        int iMatchPos;
        int bExpected;
    } ROWS[] = {{L"ab?", 0x00002, 1},        {L"ab?", 0x10001, 1},       {L"a三b", 0x00001, 0},
                {L"a三b", 0x20002, 1},       {L"a7", 0x00001, 0},        {L"a", 0x00001, 0},
                {L"abcdefghij", 0x00009, 1}, {L"abcdefghij", 0x0FFFF, 0}};
    for (const auto& row : ROWS)
    {
        tag_LocalizerDetail detail = DetailOf(Codes(row.szName));
        detail.iMatchPos = row.iMatchPos;
        EXPECT_EQ(Manager::JudgeAllEnglish(&detail), row.bExpected) << row.iMatchPos;
    }
    tag_LocalizerDetail wide = DetailOf(L"\x15000");
    EXPECT_EQ(Manager::JudgeAllEnglish(&wide), 0);
    EXPECT_EQ(Manager::JudgeAllEnglish(nullptr), 0);
}

TEST_F(Compare, FindsThePlaceOfAChangedRecord)
{
    const auto recordOf = [&](const std::wstring& strName, long long llTime)
    {
        tag_ContactsStruct record = {};
        std::copy(strName.begin(), strName.end(), record.szName);
        if (!strName.empty())
        {
            record.szLocalizerKey[0] = Codes(strName.substr(0, 1))[0];
        }
        record.llLastTimeContacted = llTime;
        return record;
    };
    std::vector<tag_ContactsStruct> vStored = {recordOf(L"三", 30), recordOf(L"张三", 20),
                                               recordOf(L"", 10)};
    ASSERT_EQ(Manager::TransNameToPY(vStored.data(), 3), 0);
    const struct
    {
        const wchar_t* szName;
        int iCount;
        int iSortType;
        long long llTime;
        int iExpected;
        const wchar_t* szNameAfter;
    } ROWS[] = {{L"愛", 3, 0, 0, 0, L"ai 爱"},   {L"李", 3, 0, 0, 0, L"li 李"},
                {L"Sun", 3, 0, 0, 0, L"sun"},    {L"宋", 3, 0, 0, 1, L"song 宋"},
                {L"宋", 3, 7, 0, 1, L"song 宋"}, {L"张三", 3, 0, 0, 1, L"zhang 张san 三"},
                {L"赵", 3, 0, 0, 2, L"zhao 赵"}, {L"赵", 2, 0, 0, 2, L"zhao 赵"},
                {L"赵", 0, 0, 0, 0, L"zhao 赵"}, {L"赵", 3, 1, 25, 1, L"赵"},
                {L"赵", 3, 1, 99, 0, L"赵"},     {L"赵", 3, 1, 10, 3, L"赵"},
                {L"赵", 1, 1, 40, 0, L"赵"}};
    for (const auto& row : ROWS)
    {
        tag_ContactsStruct record = recordOf(row.szName, row.llTime);
        EXPECT_EQ(Manager::LocalizerSearchPos(vStored.data(), row.iCount, &record, row.iSortType),
                  row.iExpected)
            << row.iSortType << ' ' << row.iCount;
        EXPECT_EQ(std::wstring(record.szName), row.szNameAfter);
    }
    tag_ContactsStruct record = recordOf(L"赵", 25);
    EXPECT_EQ(Manager::LocalizerSearchPos(nullptr, 3, &record, 0), -1);
    EXPECT_EQ(Manager::LocalizerSearchPos(vStored.data(), 3, nullptr, 0), -1);
    RemoveTable();
    const CLogCapture log;
    EXPECT_EQ(Manager::LocalizerSearchPos(vStored.data(), 3, &record, 0), -1);
    EXPECT_STREQ(record.szName, L"赵");
    EXPECT_EQ(Manager::LocalizerSearchPos(vStored.data(), 3, &record, 1), 1) << "asks no table";
}
