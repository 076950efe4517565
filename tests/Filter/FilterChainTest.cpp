#include "Filter/FilterChain.h"

#include <gtest/gtest.h>

#include <memory>
#include <type_traits>

#include "Filter/FilterChainBuilder.h"
#include "Filter/FilterProcess.h"
#include "Filter/FilterProcessFactory.h"
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

TEST(FilterChain, DeletesEachFilterOnceAlsoOneThatFindsNoPlace)
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
        EXPECT_EQ(chain.GetFilterByNo(1), nullptr);
        EXPECT_EQ(chain.GetFilterByNo(-1), nullptr);
        EXPECT_EQ(chain.GetFilterByNo(2 * FILTER_NUM), nullptr);
    }
    EXPECT_EQ(iDeleted, FILTER_NUM);
    CFilterChain chain;
    CFilter* pFilter = new CCountedFilter(&iDeleted);
    {
        const CMemoryFailure failure(0);
        chain.SetFilter(pFilter);
    }
    EXPECT_EQ(iDeleted, FILTER_NUM + 1);
    EXPECT_EQ(chain.GetFilterNum(), 0);
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
    for (int iNum : {0, INT32_MIN})
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
    const int aiFilters[] = {-1, 0, 0, 1, 2}; // -1: no chain
    for (int iGranted = 0; iGranted < 5; ++iGranted)
    {
        CFilterChain garbage;
        CFilterChain* pChain = &garbage;
        int iResult = 0;
        {
            const CMemoryFailure failure(iGranted);
            iResult = BuildFilterChain(aiType, alID, 3, &pChain);
        }
        ASSERT_NE(pChain, &garbage) << iGranted;
        const std::unique_ptr<CFilterChain> pOwned(pChain);
        EXPECT_EQ(iResult, iGranted < 4 ? -1 : 0) << iGranted;
        EXPECT_EQ(pOwned ? pOwned->GetFilterNum() : -1, aiFilters[iGranted]) << iGranted;
    }
}

// The sanitizers see a process that is not freed.
TEST(FilterProcessFactory, MakesNoShorterPipeline)
{
    for (int iGranted = 0; iGranted <= 10; ++iGranted)
    {
        std::unique_ptr<FilterProcess> pFirst;
        {
            const CMemoryFailure failure(iGranted);
            pFirst.reset(FilterProcessFactory::CreateFilterProcess());
        }
        EXPECT_EQ(pFirst != nullptr, iGranted == 10) << iGranted;
    }
}

} // namespace
