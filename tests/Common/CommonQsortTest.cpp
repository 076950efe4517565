// The order of records, the exact permutation that sorting leaves of equal ones, which stores
// already written have, and which of several equal ones a search meets.

#include "Common/CommonQsort.h"

#include "Core/Records/ContactRecords.h"
#include "Core/Records/LocalizerCodes.h"

#include <climits>
#include <gtest/gtest.h>
#include <sstream>
#include <string>
#include <tuple>
#include <vector>

namespace
{

using Records = std::vector<tag_ContactsStruct>;

char* Bytes(Records& vRecords)
{
    return reinterpret_cast<char*>(vRecords.data());
}

// A record for each character, which is its name and its time; its id is its place.
Records MakeRecords(const std::string& strValues)
{
    Records vRecords(strValues.size(), tag_ContactsStruct{});
    for (size_t i = 0; i < vRecords.size(); ++i)
    {
        vRecords[i].iContactID = static_cast<int32_t>(i);
        vRecords[i].szName[0] = static_cast<wchar_t>(strValues[i]);
        vRecords[i].llLastTimeContacted = strValues[i];
    }
    return vRecords;
}

// The places after a sort, as letters.
std::string Sorted(const std::string& strValues, Common_Sort_enum eOrder)
{
    Records vRecords = MakeRecords(strValues);
    const int iCount = static_cast<int>(vRecords.size());
    EXPECT_EQ(Common_Qsort().QuickSort(Bytes(vRecords), iCount, eOrder), iCount);
    std::string strPlaces;
    for (const tag_ContactsStruct& record : vRecords)
    {
        const int iPlace = record.iContactID;
        strPlaces += static_cast<char>(iPlace < 26 ? 'a' + iPlace : 'A' + iPlace - 26);
    }
    return strPlaces;
}

tag_ContactsStruct Record(const std::wstring& strName, wchar_t code, int64_t llTime = 0)
{
    tag_ContactsStruct record = {};
    strName.copy(record.szName, CONTACT_MAX_NAME + 1);
    record.szLocalizerKey[0] = code;
    record.llLastTimeContacted = llTime;
    return record;
}

} // namespace

TEST(CommonQsort, LeavesEqualRecordsWhereItsStepsLeaveThem)
{
    const char* const ROWS[][3] = {
        // values, by name, by time
        {"1", "a", "a"},
        {"12121", "acebd", "bdace"},
        {"121212", "aecdbf", "fbdcea"},
        {"3141592653589793", "bdgajpceikhnlmof", "omflnheikcajpgdb"},
        {"2718281828459045235360287471352662497757247093699959",
         "vnRgBcHwEOqeiartTCPIzoksDYpMlGFuUQbLNKAydfjhxXWVSmJZ",
         "ZmWVSJXxjdhfbNKyQALGuFUMsYlDpIPzokTrtCweiHaEOqgcBvnR"},
    };
    for (const auto& [szValues, szByName, szByTime] : ROWS)
    {
        EXPECT_EQ(Sorted(szValues, SORT_NAME), szByName);
        EXPECT_EQ(Sorted(szValues, SORT_TIME), szByTime);
    }
}

// For the keys 0 to 9: the place to insert at, and the same of the search that prefers an equal
// record; '!' where it met one, which is then what the search for records finds.
TEST(CommonQsort, MeetsOneOfTheEqualRecords)
{
    const char* const ROWS[][3] = {
        {"", "0000000000", "0000000000"},           {"5", "1111110000", "111110!0000"},
        {"64", "2222210000", "22221!10!000"},       {"44", "2222000000", "22220!00000"},
        {"87521", "5533322100", "54!3!332!21!0!0"}, {"887777532", "9997766400", "998!7!76!64!0!0"},
    };
    for (const auto& [szTimes, szPlaces, szMarked] : ROWS)
    {
        Records vRecords = MakeRecords(szTimes);
        const int iCount = static_cast<int>(vRecords.size());
        char* const pRecords = Bytes(vRecords);
        std::ostringstream places;
        std::ostringstream marked;
        for (const char cKey : std::string("0123456789"))
        {
            Records vKey = MakeRecords({cKey});
            char* const pKey = Bytes(vKey);
            Common_Qsort sorter;
            int bMarked = 0;
            places << sorter.Search_Bin(pRecords, iCount, pKey, SORT_TIME, 1);
            const int iMarked = sorter.Search_BinEx(pRecords, iCount, pKey, SORT_TIME, 1, &bMarked);
            marked << iMarked << (bMarked == 1 ? "!" : "");
            const int iFound = bMarked == 1 ? iMarked : -1;
            bMarked = 0;
            EXPECT_EQ(sorter.Search_Bin(pRecords, iCount, pKey, SORT_TIME, 0), iFound);
            EXPECT_EQ(sorter.Search_BinEx(pRecords, iCount, pKey, SORT_TIME, 0, &bMarked), iFound);
            EXPECT_EQ(bMarked, 0);
        }
        EXPECT_EQ(places.str(), szPlaces) << szTimes;
        EXPECT_EQ(marked.str(), szMarked);
    }
}

TEST(CommonQsort, OrdersNamesAndTimes)
{
    const std::wstring strEmpty(1, NAME_EMPTY_MARK);
    const std::wstring strLong(31, L'a');
    const std::tuple<Common_Sort_enum, tag_ContactsStruct, tag_ContactsStruct> ROWS[] = {
        {SORT_NAME, Record(L"a", 0x4F00), Record(L"ab", 0x4F00)},
        {SORT_NAME, Record(strLong.substr(1), 0x4F00), Record(strLong, 0x4F00)},
        // A letter goes before a Chinese character under one first letter only.
        {SORT_NAME, Record(L"az", 0x4F00), Record(L"aa", 0x1000)},
        {SORT_NAME, Record(L"az", 0x4F19), Record(L"aa", 0x4C3D)},
        {SORT_NAME, Record(L"az", 0x1000), Record(L"bb", 0x4F00)},
        {SORT_NAME, Record(L"aa", 0x4C3E), Record(L"az", 0x4F00)}, // no Chinese character's code
        {SORT_NAME, Record(L"aa", 0x1000), Record(L"az", 0x4F1A)}, // no letter's code
        // Nameless behind all others, then other characters, then digits.
        {SORT_NAME, Record(L"z", 0x5000), Record(strEmpty, 0)},
        {SORT_NAME, Record(L"z", 0x5A00), Record(L"a", 0x5000)},
        {SORT_NAME, Record(L"z", 0x1000), Record(L"a", 0x5A00)},
        {SORT_NAME, Record(L"z", 0x1000), Record(L"a", 0x5A09)},
        {SORT_NAME, Record(L"a", 0x5A0A), Record(L"z", 0x5A0A)},
        {SORT_NAME, Record(L"z", 0x15000), Record(L"a", 0x5000)},
        {SORT_NAME, Record(L"z", 0x1000), Record(L"a", 0x15A00)},
        {SORT_TIME, Record(L"", 0, INT64_MAX), Record(L"", 0, 1LL << 32)},
        {SORT_TIME, Record(L"", 0, 1LL << 32), Record(L"", 0, 1LL << 31)},
        {SORT_TIME, Record(L"", 0, 1), Record(L"", 0, 0)},
        {SORT_TIME, Record(L"", 0, 0), Record(L"", 0, -1)},
        {SORT_TIME, Record(L"", 0, -1), Record(L"", 0, INT64_MIN)},
    };
    const auto ExpectOrder = [](Common_Sort_enum eOrder, char* pBefore, char* pBehind)
    {
        Common_Qsort sorter;
        sorter.InitInterData(eOrder);
        EXPECT_EQ(sorter.QSORT_GT(pBehind, pBefore), 1);
        EXPECT_EQ(sorter.QSORT_LT(pBefore, pBehind), 1);
        EXPECT_EQ(sorter.QSORT_GT(pBefore, pBehind), 0);
        EXPECT_EQ(sorter.QSORT_LT(pBehind, pBefore), 0);
        EXPECT_EQ(sorter.QSORT_EQ(pBefore, pBehind), 0);
        EXPECT_EQ(sorter.QSORT_EQ(pBehind, pBehind), 1);
        EXPECT_EQ(sorter.QSORT_GT(pBehind, pBehind), 0);
    };
    for (const auto& [eOrder, before, behind] : ROWS)
    {
        Records vRecords = {before, behind};
        ExpectOrder(eOrder, Bytes(vRecords), Bytes(vRecords) + sizeof(tag_ContactsStruct));
    }
    PYOFWORDS aWords[] = {{"a", {}, {}}, {"三", {}, {}}, {"张", {}, {}}};
    char* const pWords = reinterpret_cast<char*>(aWords);
    ExpectOrder(SORT_PYWORD, pWords, pWords + sizeof(PYOFWORDS));
    ExpectOrder(SORT_PYWORD, pWords + sizeof(PYOFWORDS), pWords + 2 * sizeof(PYOFWORDS));
    EXPECT_EQ(Common_Qsort().Search_Bin(pWords, 3, aWords[2].szWord, SORT_PYWORD, 0), 2);
}

TEST(CommonQsort, RefusesEveryValueThatIsNoOrder)
{
    for (const int iKind : {2, 4, -1, INT_MAX})
    {
        const auto eKind = static_cast<Common_Sort_enum>(iKind);
        char szRecords[] = "ba";
        char szKey[] = "a";
        Common_Qsort sorter;
        EXPECT_EQ(-1, sorter.QuickSort(szRecords, 2, eKind));
        EXPECT_EQ(-1, sorter.QuickSort(szRecords, 0, SORT_TIME));
        EXPECT_STREQ("ba", szRecords);
        EXPECT_EQ(-1, sorter.Search_Bin(szRecords, 2, szKey, eKind, 1));
        EXPECT_EQ(-1, sorter.QSORT_GT(szRecords, szKey));
    }
}
