// A search over a large address book must not need more stack than one over a small one: it runs
// on threads of callers that have little.

#include "LocalizerImpl/QVLocalizerManager.h"
#include "LocalizerImpl/QVWordLocalizerManager.h"
#include "tests/LocalizerImpl/LocalizerFixture.h"
#include "tests/LocalizerImpl/SearchModel.h"

#include <gtest/gtest.h>
#include <pthread.h>

#include <functional>
#include <vector>

namespace
{

constexpr size_t SMALL_STACK = 192 * 1024; // sanitizers take most of it
constexpr int MANY = 100000;
constexpr int TIED = 3000;

void* RunBody(void* pBody)
{
    (*static_cast<std::function<void()>*>(pBody))();
    return nullptr;
}

void OnSmallStack(std::function<void()> fnBody)
{
    pthread_attr_t attributes;
    ASSERT_EQ(0, pthread_attr_init(&attributes));
    ASSERT_EQ(0, pthread_attr_setstacksize(&attributes, SMALL_STACK));
    pthread_t thread;
    ASSERT_EQ(0, pthread_create(&thread, &attributes, RunBody, &fnBody));
    pthread_join(thread, nullptr);
    pthread_attr_destroy(&attributes);
}

using CSmallStackTest = LocalizerFixture;

TEST_F(CSmallStackTest, OneSurnameTypedByItsInitial)
{
    const std::wstring strCodes = {HanZi(L'张'), HanZi(L'三')};
    std::vector<tag_LocalizerDetail> vNames;
    for (int i = 0; i < MANY; ++i)
    {
        vNames.push_back(MakeDetail(i, MANY - i, strCodes)); // farthest from name order
    }
    std::vector<tag_LocalizerDetail> vFound(vNames.size());
    tag_LocalizerResult candidates = {MANY, vNames.data()};
    tag_LocalizerResult result = {MANY, vFound.data()};
    OnSmallStack(
        [&]
        {
            CQVWordLocalizerManager matcher(1);
            wchar_t szInput[] = L"z";
            wchar_t szWords[64] = {};
            long lMask = 0;
            EXPECT_EQ(0, matcher.DoSearch(&candidates, szInput, IME_SEARCH_WORD, 0, &result, &lMask,
                                          szWords));
        });
    ASSERT_EQ(MANY, result.iResultNum);
    for (int i = 0; i < MANY; ++i)
    {
        ASSERT_EQ(i + 1, vFound[static_cast<size_t>(i)].iSortIndex);
    }
}

TEST_F(CSmallStackTest, AnOrderedSetOfTies)
{
    std::vector<tag_LocalizerDetail> vNames(TIED);
    android::Vector<_MatchResult> vMatches;
    for (int i = 0; i < TIED; ++i)
    {
        vNames[static_cast<size_t>(i)].iSortIndex = i / 2;
        vMatches.push({i, MATCH_INITIALS, 0, 0});
    }
    OnSmallStack(
        [&] { CQVLocalizerManager::LocalResultQuickSort(vMatches, 0, TIED - 1, vNames.data()); });
    for (size_t i = 0; i < TIED; ++i)
    {
        ASSERT_EQ(static_cast<int>(i / 2),
                  vNames[static_cast<size_t>(vMatches[i].iIndex)].iSortIndex);
    }
}

} // namespace
