#include "LocalizerImpl/MatchRanking.h"

#include "LocalizerImpl/StepQuickSort.h"

#include <algorithm>
#include <iterator>
#include <memory>
#include <new>
#include <utility>

namespace
{

// Places in name order are sorted digit by digit.
constexpr int DIGIT_BITS = 11;
constexpr int DIGITS = 3;
constexpr size_t DIGIT_VALUES = 1U << DIGIT_BITS;
constexpr uint32_t DIGIT_MASK = DIGIT_VALUES - 1;
constexpr uint32_t SIGN_BIT = 0x80000000;
constexpr int PLACE_BITS = 32;

// Kind, start and span of a match from one search: starts are 0..9, spans 1..10.
constexpr int BUCKET_POSITION_BITS = 4;
constexpr int BUCKET_COUNT = (MATCH_INITIALS + 1) << (2 * BUCKET_POSITION_BITS);

int StartOf(const _MatchResult& match)
{
    return MatchFirst(match.iMatchPos);
}

int EndOf(const _MatchResult& match)
{
    return MatchLast(match.iMatchPos);
}

// The first three keys, the fourth being the place in name order: -1, 0 or 1.
int CompareFit(const _MatchResult& a, const _MatchResult& b)
{
    if (a.iMatchType != b.iMatchType)
    {
        return a.iMatchType > b.iMatchType ? -1 : 1;
    }
    if (StartOf(a) != StartOf(b))
    {
        return StartOf(a) < StartOf(b) ? -1 : 1;
    }
    // One start: the longer span is the later end.
    if (EndOf(a) != EndOf(b))
    {
        return EndOf(a) > EndOf(b) ? -1 : 1;
    }
    return 0;
}

int BucketOf(const _MatchResult& match)
{
    constexpr int FIELD = (1 << BUCKET_POSITION_BITS) - 1;
    const int iKind = MATCH_INITIALS - match.iMatchType;
    const int iStart = StartOf(match) & FIELD;
    const int iSpan = (FIELD - (EndOf(match) - StartOf(match))) & FIELD;
    return (((iKind << BUCKET_POSITION_BITS) | iStart) << BUCKET_POSITION_BITS) | iSpan;
}

// A match by its entry's place in name order.
struct tag_NamePlace
{
    uint32_t uPlace; // with its sign turned, so that unsigned order is the order of the places
    uint32_t uMatch;

    uint32_t Digit(int iDigit) const { return (uPlace >> (iDigit * DIGIT_BITS)) & DIGIT_MASK; }
};

using NamePlaces = std::unique_ptr<tag_NamePlace[]>;

// Moves the places into the order of one of their digits; equal ones keep their order.
void SortByDigit(const tag_NamePlace* pFrom, tag_NamePlace* pTo, size_t uCount, int iDigit)
{
    size_t aEnds[DIGIT_VALUES] = {};
    for (size_t i = 0; i < uCount; ++i)
    {
        ++aEnds[pFrom[i].Digit(iDigit)];
    }
    size_t uStart = 0;
    for (size_t& uEnd : aEnds)
    {
        uStart += std::exchange(uEnd, uStart);
    }
    for (size_t i = 0; i < uCount; ++i)
    {
        pTo[aEnds[pFrom[i].Digit(iDigit)]++] = pFrom[i];
    }
}

// The candidates of a search in the whole store come in name order; those of a narrowed one are
// ranked, and those of a store ordered by last contact in any order. False if the allocation fails.
bool SortByName(NamePlaces& places, size_t uCount)
{
    const auto before = [](const tag_NamePlace& a, const tag_NamePlace& b)
    { return a.uPlace < b.uPlace; };
    if (std::is_sorted(places.get(), places.get() + uCount, before))
    {
        return true;
    }
    NamePlaces spare(new (std::nothrow) tag_NamePlace[uCount]);
    if (spare == nullptr)
    {
        return false;
    }
    const uint32_t uLargest = std::max_element(places.get(), places.get() + uCount, before)->uPlace;
    const uint32_t uSmallest =
        std::min_element(places.get(), places.get() + uCount, before)->uPlace;
    for (int i = 0; i < DIGITS && (uLargest ^ uSmallest) >> (i * DIGIT_BITS) != 0; ++i)
    {
        SortByDigit(places.get(), spare.get(), uCount, i);
        places.swap(spare);
    }
    return true;
}

NamePlaces PlacesOf(const android::Vector<_MatchResult>& vMatches,
                    const tag_LocalizerDetail* pDetail)
{
    const size_t uCount = vMatches.size();
    NamePlaces places(new (std::nothrow) tag_NamePlace[uCount]);
    for (size_t i = 0; places != nullptr && i < uCount; ++i)
    {
        const int32_t iPlace = pDetail[vMatches[i].iIndex].iSortIndex;
        places[i] = {static_cast<uint32_t>(iPlace) ^ SIGN_BIT, static_cast<uint32_t>(i)};
    }
    return places != nullptr && SortByName(places, uCount) ? std::move(places) : nullptr;
}

// Distributes the matches, taken in name order, over kind, start and span.
void Distribute(const android::Vector<_MatchResult>& vMatches, const tag_NamePlace* pPlaces,
                _MatchResult* pSorted)
{
    size_t aEnds[BUCKET_COUNT] = {};
    for (size_t i = 0; i < vMatches.size(); ++i)
    {
        ++aEnds[BucketOf(vMatches[i])];
    }
    size_t uStart = 0;
    for (size_t& uEnd : aEnds)
    {
        uStart += std::exchange(uEnd, uStart);
    }
    for (size_t i = 0; i < vMatches.size(); ++i)
    {
        const _MatchResult& match = vMatches[pPlaces[i].uMatch];
        pSorted[aEnds[BucketOf(match)]++] = match;
    }
}

// Whether two matches are equal in all four keys.
bool HasTies(const tag_NamePlace* pPlaces, const _MatchResult* pSorted, size_t uCount,
             const tag_LocalizerDetail* pDetail)
{
    const auto same = [](const tag_NamePlace& a, const tag_NamePlace& b)
    { return a.uPlace == b.uPlace; };
    if (std::adjacent_find(pPlaces, pPlaces + uCount, same) == pPlaces + uCount)
    {
        return false;
    }
    const auto tied = [pDetail](const _MatchResult& a, const _MatchResult& b)
    { return CompareMatches(a, b, pDetail) == 0; };
    return std::adjacent_find(pSorted, pSorted + uCount, tied) != pSorted + uCount;
}

// A match with its four ranking keys in one number.
struct tag_RankedMatch
{
    uint64_t uRank;
    uint32_t uMatch;
};

// Sorts matches of which some are equal in all four keys: those keep the order that the quicksort
// leaves when it starts from the order of discovery, split by split and candidate by candidate.
bool SortWithTies(const android::Vector<_MatchResult>& vMatches, const uint16_t* pFirstSplits,
                  const tag_LocalizerDetail* pDetail, _MatchResult* pSorted)
{
    const size_t uCount = vMatches.size();
    const std::unique_ptr<tag_RankedMatch[]> ranked(new (std::nothrow) tag_RankedMatch[uCount]);
    if (ranked == nullptr)
    {
        return false;
    }
    for (size_t i = 0; i < uCount; ++i)
    {
        const auto uPlace = static_cast<uint32_t>(pDetail[vMatches[i].iIndex].iSortIndex);
        const auto uBucket = static_cast<uint64_t>(BucketOf(vMatches[i]));
        ranked[i] = {uBucket << PLACE_BITS | (uPlace ^ SIGN_BIT), static_cast<uint32_t>(i)};
    }
    std::sort(ranked.get(), ranked.get() + uCount,
              [pFirstSplits](const tag_RankedMatch& a, const tag_RankedMatch& b)
              {
                  return std::pair(pFirstSplits[a.uMatch], a.uMatch) <
                         std::pair(pFirstSplits[b.uMatch], b.uMatch);
              });
    QuickSort(ranked.get(), 0, static_cast<int>(uCount) - 1,
              [](const tag_RankedMatch& a, const tag_RankedMatch& b) {
                  return static_cast<int>(a.uRank > b.uRank) - static_cast<int>(a.uRank < b.uRank);
              });
    for (size_t i = 0; i < uCount; ++i)
    {
        pSorted[i] = vMatches[ranked[i].uMatch];
    }
    return true;
}

} // namespace

int CompareMatches(const _MatchResult& a, const _MatchResult& b, const tag_LocalizerDetail* pDetail)
{
    const int iFit = CompareFit(a, b);
    if (iFit != 0)
    {
        return iFit;
    }
    const int32_t iIndexA = pDetail[a.iIndex].iSortIndex;
    const int32_t iIndexB = pDetail[b.iIndex].iSortIndex;
    return static_cast<int>(iIndexA > iIndexB) - static_cast<int>(iIndexA < iIndexB);
}

int RankMatches(android::Vector<_MatchResult>& vMatches, const uint16_t* pFirstSplits,
                tag_LocalizerDetail* pDetail)
{
    const size_t uCount = vMatches.size();
    const NamePlaces places = PlacesOf(vMatches, pDetail);
    const std::unique_ptr<_MatchResult[]> sorted(new (std::nothrow) _MatchResult[uCount]);
    if (places == nullptr || sorted == nullptr)
    {
        return -1;
    }
    Distribute(vMatches, places.get(), sorted.get());
    if (HasTies(places.get(), sorted.get(), uCount, pDetail) &&
        !SortWithTies(vMatches, pFirstSplits, pDetail, sorted.get()))
    {
        return -1;
    }
    std::copy_n(sorted.get(), uCount, vMatches.editArray());
    return 0;
}
