// Patches of many records against taking out and putting in one after the other.

#include "MemManager/StorePatch.h"

#include "Common/CommonQsort.h"
#include "Core/Records/LocalizerCodes.h"
#include "MemManager/Files/MappingGuards.h"
#include "MemManager/SlotPlan.h"
#include "MemManager/StoreRegister.h"
#include "tests/Support/DataDirectory.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cstring>
#include <random>
#include <string>
#include <vector>

namespace
{

using Records = std::vector<tag_ContactsStruct>;

constexpr int SPARE = 500;

class CManyChanges : public testing::TestWithParam<Common_Sort_enum>
{
protected:
    // Few names and times, so that many records are equal, and scripts under one first letter,
    // which the order does not tell apart consistently.
    Records MakeRecords(size_t uNum)
    {
        Records vRecords(uNum);
        for (tag_ContactsStruct& record : vRecords)
        {
            record.iContactID = static_cast<int32_t>(m_rng() % 1'000'000) + 1;
            record.szName[0] = static_cast<wchar_t>(L'a' + m_rng() % 5);
            record.szName[1] = static_cast<wchar_t>(L'a' + m_rng() % 3);
            record.szLocalizerKey[0] = m_rng() % 2 == 0 ? LOC_HANZI_BASE : LOC_ALPHA_BASE;
            record.llLastTimeContacted = static_cast<int64_t>(m_rng() % 40);
            record.iSortIndex = -1;
        }
        return vRecords;
    }
    std::vector<int> PickSlots(size_t uOf)
    {
        std::vector<int> vSlots;
        const unsigned uRate = m_rng() % 4;
        for (size_t i = 0; i < uOf; ++i)
        {
            if (m_rng() % 3 < uRate)
            {
                vSlots.push_back(static_cast<int>(i));
            }
        }
        return vSlots;
    }

    std::mt19937 m_rng{5};
    CDataDirectory m_directory;
    std::string m_strFile = m_directory.File("records.bin");
};

TEST_P(CManyChanges, LeaveTheBytesOfOneAfterTheOther)
{
    for (int iRound = 0; iRound < 300; ++iRound)
    {
        SCOPED_TRACE(iRound);
        const size_t uMost = iRound % 10 == 0 ? 3 * CSlotPlan::MAX_CHANGES : 30;
        Records vModel = MakeRecords(m_rng() % uMost);
        Common_Qsort().QuickSort(reinterpret_cast<char*>(vModel.data()),
                                 static_cast<int>(vModel.size()), GetParam());
        Records vInserted = MakeRecords(m_rng() % uMost);
        const std::vector<int> vRemoved = PickSlots(vModel.size());
        const int iCapacity = static_cast<int>(vModel.size()) + SPARE;
        const CWriteMapping store(m_strFile.c_str(), StoreBytes(iCapacity));
        auto* pStore = store.As<tag_ContactsStruct>();
        std::copy(vModel.begin(), vModel.end(), pStore);
        CStorePatch patch(pStore, iCapacity - SPARE, iCapacity,
                          GetParam() == SORT_TIME ? STORE_ORDER_TIME : STORE_ORDER_NAME);

        for (size_t i = vRemoved.size(); i > 0; --i)
        {
            vModel.erase(vModel.begin() + vRemoved[i - 1]);
        }
        patch.Remove(vRemoved.data(), static_cast<int>(vRemoved.size()));
        tag_ContactsInfo inserted = {static_cast<int>(vInserted.size()), vInserted.data()};
        const size_t uRoom = static_cast<size_t>(iCapacity) - vModel.size();
        EXPECT_EQ(patch.Insert(inserted), vInserted.size() > uRoom ? PATCH_FULL : PATCH_DONE);
        vInserted.resize(std::min(vInserted.size(), uRoom));
        for (tag_ContactsStruct record : vInserted)
        {
            record.iSortIndex = Common_Qsort().Search_Bin(
                reinterpret_cast<char*>(vModel.data()), static_cast<int>(vModel.size()),
                reinterpret_cast<char*>(&record), GetParam(), 1);
            vModel.insert(vModel.begin() + record.iSortIndex, record);
        }
        ASSERT_EQ(static_cast<size_t>(patch.Count()), vModel.size());
        ASSERT_EQ(std::memcmp(pStore, vModel.data(), vModel.size() * sizeof(vModel[0])), 0);
    }
}

INSTANTIATE_TEST_SUITE_P(Orders, CManyChanges, testing::Values(SORT_NAME, SORT_TIME));

} // namespace
