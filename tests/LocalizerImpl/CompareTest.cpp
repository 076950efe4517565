// The search's operations called directly: what one comparison answers, and the place of a changed
// record. The search as a whole is compared with its model elsewhere.

#include "LocalizerImpl/QVWordLocalizerManager.h"
#include "tests/LocalizerImpl/LocalizerFixture.h"

#include <algorithm>
#include <tuple>
#include <vector>

namespace
{

using Manager = CQVLocalizerManager;

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
    Compared Do(const wchar_t* szName, std::wstring strPiece, int iKeyLen, int bAllFull) const
    {
        CQVWordLocalizerManager matcher(1);
        android::Vector<wchar_t*> vPieces;
        vPieces.push(strPiece.data());
        tag_LocalizerDetail detail = DetailOf(Codes(szName));
        const int iMatch = matcher.DoCompare(m_pMap, &detail, vPieces, iKeyLen, bAllFull);
        return {iMatch, iKeyLen, bAllFull};
    }

    tag_ContactsStruct RecordOf(const std::wstring& strName, long long llTime) const
    {
        tag_ContactsStruct record = {};
        std::copy(strName.begin(), strName.end(), record.szName);
        record.szLocalizerKey[0] = strName.empty() ? 0 : Codes(strName.substr(0, 1))[0];
        record.llLastTimeContacted = llTime;
        return record;
    }
};

} // namespace

TEST_F(Compare, KeepsTheLengthThatItWasHandedUnlessAllIsWhole)
{
    EXPECT_EQ(Do(L"三", L"s", 7, 0), (Compared{1, 7, 0}));
    EXPECT_EQ(Do(L"三", L"san", 7, 0), (Compared{1, 1, 1}));
    EXPECT_EQ(Do(L"三", L"san", 7, 1), (Compared{1, 7, 1}));
    EXPECT_EQ(Do(L"tom", L"o", 0, 0), (Compared{1, 2, 1})) << "what is left of the name";
    EXPECT_EQ(Do(L"tom", L"to", 0, 0), (Compared{0, 0, 0}));
}

TEST_F(Compare, JudgesWhetherTheMatchedCharactersAreLettersOrOthers)
{
    const std::tuple<const wchar_t*, int, int> ROWS[] = {
        {L"ab?", 0x00002, 1}, {L"a三b", 0x00001, 0},       {L"a三b", 0x20002, 1},
        {L"a7", 0x00001, 0},  {L"abcdefghij", 0x00009, 1}, {L"abcdefghij", 0x0FFFF, 0}};
    for (const auto& [szName, iMatchPos, bExpected] : ROWS)
    {
        tag_LocalizerDetail detail = DetailOf(Codes(szName));
        detail.iMatchPos = iMatchPos;
        EXPECT_EQ(Manager::JudgeAllEnglish(&detail), bExpected) << iMatchPos;
    }
}

TEST_F(Compare, FindsThePlaceOfAChangedRecord)
{
    std::vector<tag_ContactsStruct> vStored = {RecordOf(L"三", 30), RecordOf(L"张三", 20),
                                               RecordOf(L"", 10)};
    ASSERT_EQ(Manager::TransNameToPY(vStored.data(), 3), 0);
    const struct
    {
        const wchar_t* szName;
        int iCount;
        int iSortType;
        long long llTime;
        int iExpected;
        const wchar_t* szNameAfter;
    } ROWS[] = {{L"愛", 3, 0, 0, 0, L"ai 爱"},   {L"Sun", 3, 0, 0, 0, L"sun"},
                {L"宋", 3, 0, 0, 1, L"song 宋"}, {L"张三", 3, 0, 0, 1, L"zhang 张san 三"},
                {L"赵", 3, 0, 0, 2, L"zhao 赵"}, {L"赵", 0, 0, 0, 0, L"zhao 赵"},
                {L"赵", 3, 1, 25, 1, L"赵"},     {L"赵", 3, 1, 10, 3, L"赵"}};
    for (const auto& row : ROWS)
    {
        tag_ContactsStruct record = RecordOf(row.szName, row.llTime);
        EXPECT_EQ(Manager::LocalizerSearchPos(vStored.data(), row.iCount, &record, row.iSortType),
                  row.iExpected)
            << row.iSortType << ' ' << row.iCount;
        EXPECT_EQ(std::wstring(record.szName), row.szNameAfter);
    }
    RemoveTable();
    tag_ContactsStruct record = RecordOf(L"赵", 25);
    EXPECT_EQ(Manager::LocalizerSearchPos(vStored.data(), 3, &record, 0), -1);
}
