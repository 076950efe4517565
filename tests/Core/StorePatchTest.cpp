// Patches of many records against taking out and putting in one after the other.

#include "MemManager/StorePatch.h"

#include "Common/CommonQsort.h"
#include "Core/Records/LocalizerCodes.h"
#include "MemManager/Files/MappingGuards.h"
#include "MemManager/SlotPlan.h"
#include "MemManager/StoreRegister.h"
#include "tests/Support/StoreImage.h"

#include <gtest/gtest.h>
#include <random>

namespace
{

constexpr int SPARE = 500;

class CManyChanges : public testing::TestWithParam<Common_Sort_enum>
{
protected:
    size_t Pick(size_t uNum) { return m_random() % uNum; }

    // Few names and times, so that many records are equal, and scripts under one first letter,
    // which the order does not tell apart consistently.
    Records MakeRecords(size_t uNum)
    {
        Records vRecords(uNum);
        for (tag_ContactsStruct& record : vRecords)
        {
            record.iContactID = static_cast<int32_t>(Pick(1'000'000)) + 1;
            record.szName[0] = L"abcde"[Pick(5)];
            record.szName[1] = L"abc"[Pick(3)];
            record.szLocalizerKey[0] = Pick(2) == 0 ? LOC_HANZI_BASE : LOC_ALPHA_BASE;
            record.llLastTimeContacted = static_cast<int64_t>(Pick(40));
            record.iSortIndex = -1;
        }
        return vRecords;
    }

    std::mt19937 m_random{5};
    CDataDirectory m_directory;
};

TEST_P(CManyChanges, LeaveTheBytesOfOneAfterTheOther)
{
    const int iOrder = GetParam() == SORT_TIME ? STORE_ORDER_TIME : STORE_ORDER_NAME;
    for (int iRound = 0; iRound < 300; ++iRound)
    {
        const size_t uMost = iRound % 10 == 0 ? 3 * CSlotPlan::MAX_CHANGES : 30;
        Records vModel = MakeRecords(Pick(uMost));
        Common_Qsort().QuickSort(reinterpret_cast<char*>(vModel.data()),
                                 static_cast<int>(vModel.size()), GetParam());
        const int iCapacity = static_cast<int>(vModel.size()) + SPARE;
        const CWriteMapping store(CDataPaths::ContactRecords(), StoreBytes(iCapacity));
        auto* pStore = store.As<tag_ContactsStruct>();
        std::copy(vModel.begin(), vModel.end(), pStore);
        CStorePatch patch(pStore, iCapacity - SPARE, iCapacity, iOrder);
        std::vector<int> vRemoved;
        const size_t uRate = Pick(4);
        for (size_t i = vModel.size(); i > 0; --i)
        {
            if (Pick(3) < uRate)
            {
                vRemoved.insert(vRemoved.begin(), static_cast<int>(i) - 1);
                vModel.erase(vModel.begin() + vRemoved[0]);
            }
        }
        patch.Remove(vRemoved.data(), static_cast<int>(vRemoved.size()));
        Records vInserted = MakeRecords(Pick(uMost));
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
        ASSERT_EQ(BytesOf({pStore, pStore + vModel.size()}), BytesOf(vModel)) << iRound;
    }
}

INSTANTIATE_TEST_SUITE_P(Orders, CManyChanges, testing::Values(SORT_NAME, SORT_TIME));

} // namespace
