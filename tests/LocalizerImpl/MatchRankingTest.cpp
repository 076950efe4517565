// The ranking against its steps written plainly, equal matches included.

#include "LocalizerImpl/QVLocalizerManager.h"
#include "LocalizerImpl/RankingOrder.h"
#include "tests/LocalizerImpl/PlainQuickSort.h"
#include "tests/Support/MemoryFailure.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <random>
#include <tuple>
#include <vector>

namespace
{

using Matches = std::vector<_MatchResult>;
using Details = std::vector<tag_LocalizerDetail>;

// The four keys, the smaller one first.
std::tuple<int, int, int, int> KeysOf(const _MatchResult& match, const Details& vDetails)
{
    const int iStart = match.iMatchPos >> 16;
    const int iSpan = (match.iMatchPos & 0xFFFF) - iStart + 1;
    return {-match.iMatchType, iStart, -iSpan,
            vDetails[static_cast<size_t>(match.iIndex)].iSortIndex};
}

void Fill(android::Vector<_MatchResult>& vTarget, const Matches& vMatches)
{
    for (const _MatchResult& match : vMatches)
    {
        vTarget.push(match);
    }
}

template <class TMatches>
std::vector<int> Indexes(const TMatches& vMatches)
{
    std::vector<int> vIndexes;
    for (size_t i = 0; i < vMatches.size(); ++i)
    {
        vIndexes.push_back(vMatches[i].iIndex);
    }
    return vIndexes;
}

// Matches of as many candidates, by candidate; places in name order repeat.
struct tag_Case
{
    tag_Case(std::mt19937& rng, size_t uCount) : vDetails(uCount)
    {
        const unsigned uPlaces = rng() % 2 == 0 ? 3 : 1000;
        for (size_t i = 0; i < uCount; ++i)
        {
            const int iStart = static_cast<int>(rng() % 4);
            const int iEnd = iStart + static_cast<int>(rng() % 4);
            vMatches.push_back(
                {static_cast<int>(i), 1 + static_cast<int>(rng() % 3), (iStart << 16) | iEnd, 0});
            vDetails[i].iSortIndex = static_cast<int>(rng() % uPlaces);
            vFirstSplits.push_back(static_cast<uint16_t>(512 + rng() % 4));
        }
    }

    Matches vMatches;
    Details vDetails;
    std::vector<uint16_t> vFirstSplits;
};

} // namespace

TEST(MatchRanking, LeavesEqualMatchesWhereTheQuicksortLeavesThem)
{
    std::mt19937 rng(22);
    for (int iRound = 0; iRound < 600; ++iRound)
    {
        tag_Case test(rng, 1 + rng() % 120);
        const int iLast = static_cast<int>(test.vMatches.size()) - 1;
        Matches vExpected = test.vMatches; // in the order in which they were first found
        std::stable_sort(vExpected.begin(), vExpected.end(),
                         [&](const _MatchResult& a, const _MatchResult& b)
                         {
                             return test.vFirstSplits[static_cast<size_t>(a.iIndex)] <
                                    test.vFirstSplits[static_cast<size_t>(b.iIndex)];
                         });
        android::Vector<_MatchResult> vSorted;
        Fill(vSorted, vExpected);
        android::Vector<_MatchResult> vRanked;
        Fill(vRanked, test.vMatches);
        PlainQuickSort(vExpected.data(), 0, iLast,
                       [&](const _MatchResult& a, const _MatchResult& b)
                       { return KeysOf(a, test.vDetails) < KeysOf(b, test.vDetails); });
        CQVLocalizerManager::LocalResultQuickSort(vSorted, 0, iLast, test.vDetails.data());
        ASSERT_EQ(Indexes(vSorted), Indexes(vExpected)) << "round " << iRound;
        EXPECT_EQ(RankMatches(vRanked, test.vFirstSplits.data(), test.vDetails.data()), 0);
        ASSERT_EQ(Indexes(vRanked), Indexes(vExpected)) << "round " << iRound;
    }
}

TEST(MatchRanking, LeavesTheMatchesUnsortedWithoutMemory)
{
    std::mt19937 rng(23);
    tag_Case test(rng, 50);
    android::Vector<_MatchResult> vMatches;
    Fill(vMatches, test.vMatches);
    const CMemoryFailure noMemory(0);
    EXPECT_NE(RankMatches(vMatches, test.vFirstSplits.data(), test.vDetails.data()), 0);
    EXPECT_EQ(Indexes(vMatches), Indexes(test.vMatches));
}
