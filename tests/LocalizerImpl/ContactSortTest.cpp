// The build's sort against the sorter on whole records: the same bytes, whatever the records hold.

#include "LocalizerImpl/ContactSort.h"

#include "LocalizerImpl/QVLocalizerManager.h"
#include "tests/Support/MemoryFailure.h"
#include "tests/Support/StoreImage.h"

#include <algorithm>
#include <gtest/gtest.h>
#include <random>

namespace
{

// Few different units and codes, so that many records are equal and many differ late.
tag_ContactsStruct MakeRecord(std::mt19937& rng)
{
    static const uint32_t UNITS[] = {'a',     'z',        0x5F20,     0xFFFE,     0xFFFF,
                                     0x10000, 0x7FFFFFFF, 0x80000061, 0xFFFFFFFF, '7'};
    static const uint32_t CODES[] = {0x1000, 0x4C3D, 0x4F00, 0x5000, 0x5A00, 0, 0x15000, 0x4F1A};
    tag_ContactsStruct record = {};
    record.iContactID = static_cast<int>(rng());
    record.llLastTimeContacted = static_cast<int64_t>(rng() % 5) - 2;
    const size_t uAlphabet = 1 + rng() % std::size(UNITS);
    std::generate_n(record.szName, rng() % 5 == 0 ? 31 : rng() % 15,
                    [&] { return static_cast<wchar_t>(UNITS[rng() % uAlphabet]); });
    record.szName[rng() % 31] = L'\0'; // what lies behind the end does not count
    record.szLocalizerKey[0] = static_cast<wchar_t>(CODES[rng() % std::size(CODES)]);
    return record;
}

} // namespace

TEST(ContactSort, LeavesAndNumbersWhatTheSorterLeaves)
{
    std::mt19937 rng(11);
    for (int iRound = 0; iRound < 600; ++iRound)
    {
        Records vRecords(1 + rng() % (iRound % 20 == 0 ? 500 : 40));
        std::generate(vRecords.begin(), vRecords.end(), [&] { return MakeRecord(rng); });
        const int iCount = static_cast<int>(vRecords.size());
        for (const Common_Sort_enum type : {SORT_NAME, SORT_TIME})
        {
            Records vExpected = vRecords;
            Common_Qsort().QuickSort(reinterpret_cast<char*>(vExpected.data()), iCount, type);
            Records vWithoutMemory = vRecords;
            WithMemoryFor(0, [&] { SortContacts(vWithoutMemory.data(), iCount, type); });
            ASSERT_TRUE(BytesOf(vWithoutMemory) == BytesOf(vExpected)) << "round " << iRound;
            for (int i = 0; type == SORT_NAME && i < iCount; ++i)
            {
                vExpected[static_cast<size_t>(i)].iSortIndex = i;
            }
            const int iType = type == SORT_NAME ? 0 : 1;
            EXPECT_EQ(CQVLocalizerManager::LocalizerQuickSort(vRecords.data(), iCount, iType), 0);
            ASSERT_TRUE(BytesOf(vRecords) == BytesOf(vExpected)) << "round " << iRound;
        }
    }
}
