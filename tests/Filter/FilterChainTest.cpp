#include "Filter/FilterChain.h"

#include <gtest/gtest.h>

#include <type_traits>

#include "tests/Filter/FilterTestSupport.h"
#include "tests/Support/MemoryFailure.h"

namespace
{

static_assert(!std::is_copy_constructible<CFilterChain>::value, "two chains would delete twice");

class CCountedFilter : public CFilter
{
public:
    explicit CCountedFilter(int* piDeleted) : CFilter(FILTER_PHONE), m_piDeleted(piDeleted) {}
    ~CCountedFilter() override { ++*m_piDeleted; }

private:
    int* m_piDeleted;
};

// The id that a filter of a kind with one hands out, -1000 for the other kinds.
int IdOf(const CFilter& filter)
{
    switch (filter.m_iType)
    {
    case FILTER_GROUP:
        return dynamic_cast<const CGroupFilter&>(filter).GetGroupID();
    case FILTER_GROUP_EXPAND:
        return dynamic_cast<const CGroupExpandFilter&>(filter).GetGroupID();
    case FILTER_ACCOUNT:
        return dynamic_cast<const CAccountFilter&>(filter).GetAccountID();
    case FILTER_ACCOUNT_EXPAND:
        return dynamic_cast<const CAccountExpandFilter&>(filter).GetAccountID();
    case FILTER_CONTACT_ID_EXPAND:
        return dynamic_cast<const CContactIdExpandFilter&>(filter).GetContactID();
    default:
        return -1000;
    }
}

std::vector<KindAndId> Describe(const CFilterChain& chain)
{
    std::vector<KindAndId> vFilters;
    for (int i = 0; i < chain.GetFilterNum(); ++i)
    {
        const CFilter& filter = *chain.GetFilterByNo(i);
        vFilters.emplace_back(filter.m_iType, IdOf(filter));
    }
    return vFilters;
}

TEST(FilterChain, HandsOutItsFiltersByPlace)
{
    CFilterChain chain;
    EXPECT_EQ(chain.GetFilterByNo(0), nullptr);
    CFilter* pFirst = new CMailFilter;
    CFilter* pLast = new CGroupFilter(-1);
    chain.SetFilter(pFirst);
    chain.SetFilter(nullptr);
    chain.SetFilter(pLast);
    ASSERT_EQ(chain.GetFilterNum(), 3);
    EXPECT_EQ(chain.GetFilterByNo(0), pFirst);
    EXPECT_EQ(chain.GetFilterByNo(1), nullptr);
    EXPECT_EQ(chain.GetFilterByNo(2), pLast);
    for (int iNo : {3, 4, 1000, -1, INT32_MIN, INT32_MAX})
    {
        EXPECT_EQ(chain.GetFilterByNo(iNo), nullptr) << iNo;
    }
}

TEST(FilterChain, DeletesEachFilterOnce)
{
    constexpr int FILTER_NUM = 40;
    int iDeleted = 0;
    {
        CFilterChain chain;
        for (int i = 0; i < FILTER_NUM; ++i)
        {
            chain.SetFilter(new CCountedFilter(&iDeleted));
            chain.SetFilter(nullptr);
        }
        EXPECT_EQ(iDeleted, 0);
    }
    EXPECT_EQ(iDeleted, FILTER_NUM);
}

TEST(FilterChain, DeletesAFilterThatFindsNoPlace)
{
    int iDeleted = 0;
    CFilterChain chain;
    CFilter* pFilter = new CCountedFilter(&iDeleted);
    {
        const CMemoryFailure failure(0);
        chain.SetFilter(pFilter);
    }
    EXPECT_EQ(iDeleted, 1);
    EXPECT_EQ(chain.GetFilterNum(), 0);
}

TEST(FilterChainBuilder, MakesTheFiltersThatTheArraysDescribe)
{
    constexpr int NO_ID = -1000;
    const struct
    {
        std::vector<KindAndId> vGiven;
        std::vector<KindAndId> vMade;
    } CASES[] = {
        {{}, {}},
        {{{0, 12}, {3, 99}, {5, 7}}, {{0, 12}, {5, NO_ID}}},
        {{{0, 4}, {0, 9}}, {{0, 4}, {0, 9}}},
        {{{0, 1}, {1, 2}, {2, 3}, {5, 4}, {6, 5}, {7, 6}, {8, 7}, {9, 8}, {10, 9}, {11, 10}},
         {{0, 1},
          {1, 2},
          {2, NO_ID},
          {5, NO_ID},
          {6, 5},
          {7, NO_ID},
          {8, NO_ID},
          {9, 8},
          {10, 9},
          {11, NO_ID}}},
        {{{-1, 1}, {3, 1}, {4, 1}, {12, 1}, {INT32_MIN, 1}, {INT32_MAX, 1}}, {}},
        {{{0, SECRET_GROUP_ID}, {1, 0}, {9, INT32_MIN}, {10, INT32_MAX}},
         {{0, -1}, {1, 0}, {9, INT32_MIN}, {10, INT32_MAX}}},
    };
    for (const auto& item : CASES)
    {
        EXPECT_EQ(Describe(*MakeChain(item.vGiven)), item.vMade);
    }
}

TEST(FilterChainBuilder, RefusesNullPointersAndTakesNoEntries)
{
    const int aiType[] = {FILTER_PHONE};
    const QVLong32 alID[] = {1};
    CFilterChain untouched;
    CFilterChain* pChain = &untouched;
    EXPECT_EQ(BuildFilterChain(nullptr, alID, 1, &pChain), -1);
    EXPECT_EQ(BuildFilterChain(aiType, nullptr, 1, &pChain), -1);
    EXPECT_EQ(BuildFilterChain(aiType, alID, 1, nullptr), -1);
    EXPECT_EQ(pChain, &untouched);
    for (int iNum : {0, -1, INT32_MIN})
    {
        EXPECT_EQ(BuildFilterChain(aiType, alID, iNum, &pChain), 0);
        const std::unique_ptr<CFilterChain> pOwned(pChain);
        EXPECT_EQ(pOwned->GetFilterNum(), 0);
    }
}

TEST(FilterChainBuilder, KeepsWhatItMadeBeforeMemoryRanOut)
{
    const int aiType[] = {3, FILTER_GROUP, FILTER_ONLINE};
    const QVLong32 alID[] = {0, 4, 0};
    // Memory goes to the chain, the group filter, the chain's places and the online filter.
    const struct
    {
        int iGranted;
        int iNum;
        int iResult;
        int iFilters; // -1: no chain
    } CASES[] = {{0, 3, -1, -1}, {1, 3, -1, 0}, {2, 3, -1, 0}, {2, 2, -1, 0},
                 {3, 3, -1, 1},  {3, 2, 0, 1},  {4, 3, 0, 2}};
    for (const auto& item : CASES)
    {
        CFilterChain garbage;
        CFilterChain* pChain = &garbage;
        int iResult = 0;
        {
            const CMemoryFailure failure(item.iGranted);
            iResult = BuildFilterChain(aiType, alID, item.iNum, &pChain);
        }
        ASSERT_NE(pChain, &garbage) << item.iGranted;
        const std::unique_ptr<CFilterChain> pOwned(pChain);
        EXPECT_EQ(iResult, item.iResult) << item.iGranted;
        EXPECT_EQ(pOwned ? pOwned->GetFilterNum() : -1, item.iFilters) << item.iGranted;
    }
}

} // namespace
