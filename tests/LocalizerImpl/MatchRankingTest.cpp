// The ranking against its steps written plainly, equal matches included.

#include "LocalizerImpl/QVLocalizerManager.h"
#include "LocalizerImpl/RankingOrder.h"
#include "tests/Support/MemoryFailure.h"

#include <gtest/gtest.h>
#include <pthread.h>

#include <algorithm>
#include <numeric>
#include <random>
#include <tuple>
#include <vector>

namespace
{

using Manager = CQVLocalizerManager;
using Matches = std::vector<_MatchResult>;
using Details = std::vector<tag_LocalizerDetail>;

_MatchResult MakeMatch(int iIndex, int iType, int iStart, int iEnd)
{
    return {iIndex, iType, (iStart << 16) | iEnd, 0};
}

Details MakeDetails(const std::vector<int>& vSortIndexes)
{
    Details vDetails(vSortIndexes.size());
    for (size_t i = 0; i < vDetails.size(); ++i)
    {
        vDetails[i].iSortIndex = vSortIndexes[i];
    }
    return vDetails;
}

// The four keys, the smaller one first.
std::tuple<int, int, int, int> KeysOf(const _MatchResult& match, const Details& vDetails)
{
    const int iStart = match.iMatchPos >> 16;
    const int iSpan = (match.iMatchPos & 0xFFFF) - iStart + 1;
    return {-match.iMatchType, iStart, -iSpan,
            vDetails[static_cast<size_t>(match.iIndex)].iSortIndex};
}

// The quicksort, word for word.
void PlainQuickSort(Matches& v, int iLow, int iHigh, const Details& vDetails)
{
    if (iLow == iHigh)
    {
        return;
    }
    const auto at = [&v](int i) -> _MatchResult& { return v[static_cast<size_t>(i)]; };
    const _MatchResult pivot = at(iLow);
    const auto pivotKeys = KeysOf(pivot, vDetails);
    int i = iLow;
    int j = iHigh;
    while (i < j)
    {
        while (j > i && !(KeysOf(at(j), vDetails) < pivotKeys))
        {
            --j;
        }
        if (j > i)
        {
            at(i) = at(j);
            ++i;
        }
        while (i < j && !(KeysOf(at(i), vDetails) > pivotKeys))
        {
            ++i;
        }
        if (i < j)
        {
            at(j) = at(i);
            --j;
        }
    }
    at(i) = pivot;
    if (iLow < i - 1)
    {
        PlainQuickSort(v, iLow, i - 1, vDetails);
    }
    if (j + 1 < iHigh)
    {
        PlainQuickSort(v, j + 1, iHigh, vDetails);
    }
}

void Fill(android::Vector<_MatchResult>& vTarget, const Matches& vMatches)
{
    vTarget.clear();
    for (const _MatchResult& match : vMatches)
    {
        vTarget.push(match);
    }
}

std::vector<int> Indexes(const _MatchResult* pMatches, size_t uCount)
{
    std::vector<int> vIndexes;
    std::transform(pMatches, pMatches + uCount, std::back_inserter(vIndexes),
                   [](const _MatchResult& match) { return match.iIndex; });
    return vIndexes;
}

std::vector<int> Indexes(const Matches& vMatches)
{
    return Indexes(vMatches.data(), vMatches.size());
}

std::vector<int> Indexes(const android::Vector<_MatchResult>& vMatches)
{
    return Indexes(vMatches.array(), vMatches.size());
}

// Matches of uCount candidates as one search makes them; places in name order repeat when few.
struct tag_Case
{
    tag_Case(std::mt19937& rng, size_t uCount, int iPlaces)
    {
        std::vector<int> vPlaces(uCount);
        std::iota(vPlaces.begin(), vPlaces.end(), 0);
        std::shuffle(vPlaces.begin(), vPlaces.end(), rng);
        std::transform(vPlaces.begin(), vPlaces.end(), vPlaces.begin(),
                       [iPlaces](int i) { return iPlaces > 0 ? i % iPlaces : i; });
        vDetails = MakeDetails(vPlaces);
        const size_t uVariety = 1 + rng() % 10; // of starts
        for (size_t i = 0; i < uCount; ++i)
        {
            const int iStart = static_cast<int>(rng() % uVariety);
            const int iEnd =
                iStart + static_cast<int>(rng() % (10U - static_cast<unsigned>(iStart)));
            vMatches.push_back(
                MakeMatch(static_cast<int>(i), 1 + static_cast<int>(rng() % 3), iStart, iEnd));
            vFirstSplits.push_back(static_cast<uint16_t>(512 + rng() % 4));
        }
    }

    // In the order in which the matches were first found.
    Matches Discovered() const
    {
        std::vector<size_t> vOrder(vMatches.size());
        std::iota(vOrder.begin(), vOrder.end(), 0);
        std::stable_sort(vOrder.begin(), vOrder.end(),
                         [this](size_t a, size_t b) { return vFirstSplits[a] < vFirstSplits[b]; });
        Matches vDiscovered;
        for (const size_t i : vOrder)
        {
            vDiscovered.push_back(vMatches[i]);
        }
        return vDiscovered;
    }

    Matches vMatches;
    Details vDetails;
    std::vector<uint16_t> vFirstSplits;
};

} // namespace

TEST(MatchVector, KeepsOneMatchPerContactInItsFirstPlace)
{
    android::Vector<_MatchResult> vMatches;
    EXPECT_EQ(Manager::AddToVector(vMatches, MakeMatch(5, MATCH_FULL, 0, 1)), 0);
    EXPECT_EQ(Manager::AddToVector(vMatches, MakeMatch(2, MATCH_FULL, 0, 1)), 0);
    EXPECT_EQ(Manager::AddToVector(vMatches, MakeMatch(5, MATCH_PARTIAL, 3, 3)), 0);
    EXPECT_EQ(Manager::AddToVector(vMatches, MakeMatch(0, MATCH_INITIALS, 0, 0)), 0);
    EXPECT_EQ(Indexes(vMatches), (std::vector<int>{5, 2, 0}));
    EXPECT_EQ(vMatches[0].iMatchType, MATCH_PARTIAL);
    EXPECT_EQ(vMatches[0].iMatchPos, (3 << 16) | 3);
}

TEST(MatchRanking, ComparesKindThenStartThenSpanThenName)
{
    Details vDetails = MakeDetails({7, 4, 0, 1, 2, 3, -1});
    const Matches vRanked = {MakeMatch(3, MATCH_INITIALS, 0, 0), MakeMatch(2, MATCH_INITIALS, 1, 1),
                             MakeMatch(4, MATCH_FULL, 2, 4),     MakeMatch(6, MATCH_FULL, 2, 3),
                             MakeMatch(1, MATCH_PARTIAL, 0, 0),  MakeMatch(0, MATCH_PARTIAL, 0, 0),
                             MakeMatch(5, MATCH_PARTIAL, 9, 9)};
    std::mt19937 rng(21);
    for (int iRound = 0; iRound < 200; ++iRound)
    {
        Matches vShuffled = vRanked;
        std::shuffle(vShuffled.begin(), vShuffled.end(), rng);
        android::Vector<_MatchResult> vQuick;
        Fill(vQuick, vShuffled);
        EXPECT_EQ(Manager::LocalResultQuickSort(vQuick, 0, 6, vDetails.data()), 1);
        EXPECT_EQ(Indexes(vQuick), Indexes(vRanked));
        android::Vector<_MatchResult> vExchanged;
        Fill(vExchanged, vShuffled);
        Manager::LocalResultQuickSort(vExchanged, vDetails.data());
        EXPECT_EQ(Indexes(vExchanged), Indexes(vRanked));
        const std::vector<uint16_t> vSplits(7, 1);
        Fill(vQuick, vShuffled);
        EXPECT_EQ(RankMatches(vQuick, vSplits.data(), vDetails.data()), 0);
        EXPECT_EQ(Indexes(vQuick), Indexes(vRanked));
    }
}

TEST(MatchRanking, LeavesEqualMatchesWhereTheQuicksortLeavesThem)
{
    std::mt19937 rng(22);
    for (int iRound = 0; iRound < 600; ++iRound)
    {
        tag_Case test(rng, 1 + rng() % 120, static_cast<int>(rng() % 4));
        const int iLast = static_cast<int>(test.vMatches.size()) - 1;
        Matches vExpected = test.Discovered();
        android::Vector<_MatchResult> vMatches;
        Fill(vMatches, vExpected);
        const int iLow = static_cast<int>(rng() % vExpected.size());
        Matches vPart = vExpected;
        PlainQuickSort(vPart, iLow, iLast, test.vDetails);
        EXPECT_EQ(Manager::LocalResultQuickSort(vMatches, iLow, iLast, test.vDetails.data()), 1);
        ASSERT_EQ(Indexes(vMatches), Indexes(vPart)) << "round " << iRound;

        PlainQuickSort(vExpected, 0, iLast, test.vDetails);
        Fill(vMatches, test.vMatches);
        EXPECT_EQ(RankMatches(vMatches, test.vFirstSplits.data(), test.vDetails.data()), 0);
        ASSERT_EQ(Indexes(vMatches), Indexes(vExpected)) << "round " << iRound;
    }
}

TEST(MatchRanking, LeavesTheMatchesUnsortedWithoutMemory)
{
    std::mt19937 rng(23);
    const tag_Case test(rng, 50, 3);
    Details vDetails = test.vDetails;
    android::Vector<_MatchResult> vMatches;
    for (int iGranted = 0;; ++iGranted)
    {
        Fill(vMatches, test.vMatches);
        const CMemoryFailure noMemory(iGranted);
        if (RankMatches(vMatches, test.vFirstSplits.data(), vDetails.data()) == 0)
        {
            EXPECT_EQ(noMemory.Failures(), 0);
            break;
        }
        EXPECT_EQ(Indexes(vMatches), Indexes(test.vMatches));
        ASSERT_LT(iGranted, 10);
    }
}

// In order already, each partition parts off a single match.
TEST(MatchRanking, NeedsNoStackPerMatch)
{
    constexpr size_t STACK_BYTES = 256 * 1024;
    constexpr int COUNT = 5000;
    const auto sort = [](void*) -> void*
    {
        Details vDetails(COUNT);
        android::Vector<_MatchResult> vMatches;
        for (int i = 0; i < COUNT; ++i)
        {
            vDetails[static_cast<size_t>(i)].iSortIndex = i;
            vMatches.push(MakeMatch(i, MATCH_FULL, 0, 1));
        }
        Manager::LocalResultQuickSort(vMatches, 0, COUNT - 1, vDetails.data());
        EXPECT_EQ(vMatches[COUNT - 1].iIndex, COUNT - 1);
        return nullptr;
    };
    pthread_attr_t attributes;
    ASSERT_EQ(pthread_attr_init(&attributes), 0);
    ASSERT_EQ(pthread_attr_setstacksize(&attributes, STACK_BYTES), 0);
    pthread_t thread;
    ASSERT_EQ(pthread_create(&thread, &attributes, sort, nullptr), 0);
    EXPECT_EQ(pthread_join(thread, nullptr), 0);
    pthread_attr_destroy(&attributes);
}
