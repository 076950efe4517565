// The build's sort against the sorter on whole records: the same bytes, whatever the records hold.

#include "LocalizerImpl/ContactSort.h"

#include "LocalizerImpl/QVLocalizerManager.h"
#include "tests/Support/MemoryFailure.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cstring>
#include <random>
#include <string>
#include <vector>

namespace
{

using Records = std::vector<tag_ContactsStruct>;

// Few different units and codes, so that many records are equal and many differ late.
tag_ContactsStruct MakeRecord(std::mt19937& rng, int iId)
{
    static const uint32_t UNITS[] = {'a',    'a',     'a',        'b',        'z',       0x5F20,
                                     0xFFFE, 0xFFFF,  0x10000,    0x7FFFFFFF, 0x10FFFF,  '7',
                                     ' ',    0x10061, 0x80000061, 0x80000062, 0xFFFFFFFF};
    static const uint32_t CODES[] = {0x1000, 0x4C3D, 0x4F00,  0x4F19,  0x5000,
                                     0x5A00, 0,      0x15000, 0x14F00, 0x4F1A};
    tag_ContactsStruct record = {};
    record.iContactID = iId;
    record.iSortIndex = -iId;
    record.llLastTimeContacted = static_cast<int64_t>(rng() % 5) - 2;
    const size_t uAlphabet = 1 + rng() % std::size(UNITS);
    const size_t uLength = rng() % 5 == 0 ? 31 : rng() % 15;
    std::generate_n(record.szName, uLength,
                    [&] { return static_cast<wchar_t>(UNITS[rng() % uAlphabet]); });
    if (rng() % 10 == 0)
    {
        record.szName[0] = NAME_EMPTY_MARK;
    }
    record.szLocalizerKey[0] = static_cast<wchar_t>(CODES[rng() % std::size(CODES)]);
    return record;
}

Records MakeRecords(std::mt19937& rng, size_t uCount)
{
    Records vRecords;
    for (size_t i = 0; i < uCount; ++i)
    {
        vRecords.push_back(MakeRecord(rng, static_cast<int>(i)));
    }
    return vRecords;
}

Records Sorted(Records vRecords, Common_Sort_enum type)
{
    Common_Qsort().QuickSort(reinterpret_cast<char*>(vRecords.data()),
                             static_cast<int>(vRecords.size()), type);
    return vRecords;
}

std::vector<int> Ids(const Records& vRecords)
{
    std::vector<int> vIds;
    std::transform(vRecords.begin(), vRecords.end(), std::back_inserter(vIds),
                   [](const tag_ContactsStruct& record) { return record.iContactID; });
    return vIds;
}

bool SameBytes(const Records& a, const Records& b)
{
    return std::memcmp(a.data(), b.data(), a.size() * sizeof(a[0])) == 0;
}

} // namespace

TEST(ContactSort, LeavesWhatTheSorterLeaves)
{
    std::mt19937 rng(11);
    for (int iRound = 0; iRound < 400; ++iRound)
    {
        const Records vRecords = MakeRecords(rng, 1 + rng() % (iRound % 20 == 0 ? 500 : 40));
        for (const Common_Sort_enum type : {SORT_NAME, SORT_TIME})
        {
            const Records vExpected = Sorted(vRecords, type);
            Records vByKeys = vRecords;
            SortContacts(vByKeys.data(), static_cast<int>(vByKeys.size()), type);
            ASSERT_EQ(Ids(vByKeys), Ids(vExpected)) << "round " << iRound << ", order " << type;
            ASSERT_TRUE(SameBytes(vByKeys, vExpected));
            Records vWithoutMemory = vRecords;
            const CMemoryFailure noMemory(0);
            SortContacts(vWithoutMemory.data(), static_cast<int>(vRecords.size()), type);
            ASSERT_TRUE(SameBytes(vWithoutMemory, vExpected));
        }
    }
}

TEST(ContactSort, NumbersTheNameOrderAndKeepsTheNumbersInTimeOrder)
{
    std::mt19937 rng(12);
    const auto sort = [](Records& vRecords, int iSortType)
    {
        return CQVLocalizerManager::LocalizerQuickSort(
            vRecords.data(), static_cast<int>(vRecords.size()), iSortType);
    };
    for (const int iNameOrder : {0, 2, -1, 3}) // all but 1 act as 0
    {
        Records vRecords = MakeRecords(rng, 200);
        Records vExpected = Sorted(vRecords, SORT_NAME);
        EXPECT_EQ(sort(vRecords, iNameOrder), 0);
        for (size_t i = 0; i < vExpected.size(); ++i)
        {
            vExpected[i].iSortIndex = static_cast<int>(i);
        }
        EXPECT_TRUE(SameBytes(vRecords, vExpected)) << iNameOrder;
        EXPECT_EQ(sort(vRecords, 1), 0);
        EXPECT_TRUE(SameBytes(vRecords, Sorted(vExpected, SORT_TIME)));
    }
    EXPECT_EQ(CQVLocalizerManager::LocalizerQuickSort(nullptr, 3, 0), 0);
}
