// The ranking of matches and the order of stored records.

#include "LocalizerImpl/ContactSort.h"
#include "LocalizerImpl/QVLocalizerManager.h"
#include "LocalizerImpl/RankingOrder.h"

#include <algorithm>
#include <iterator>
#include <memory>
#include <new>
#include <utility>

namespace
{

constexpr int SPLIT_SHIFT = 32; // a discovery key: split above, place in the vector below
constexpr int RANGE_STACK_DEPTH = 32;

// Places in name order are sorted digit by digit.
constexpr int DIGIT_BITS = 8;
constexpr int DIGITS = 4;
constexpr size_t DIGIT_VALUES = 1U << DIGIT_BITS;
constexpr uint32_t DIGIT_MASK = DIGIT_VALUES - 1;
constexpr uint32_t SIGN_BIT = 0x80000000;

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

// Negative when a comes before b in the ranking, positive when behind.
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

// Moves the entries around the first one as a hole travels between the ends; returns where the
// first one came to stand.
int PartitionMatches(android::Vector<_MatchResult>& vMatches, int iLow, int iHigh,
                     const tag_LocalizerDetail* pDetail)
{
    const auto at = [&vMatches](int i) -> const _MatchResult&
    { return vMatches[static_cast<size_t>(i)]; };
    const _MatchResult pivot = at(iLow);
    int i = iLow;
    int j = iHigh;
    while (i < j)
    {
        while (j > i && CompareMatches(at(j), pivot, pDetail) >= 0)
        {
            --j;
        }
        if (j > i)
        {
            vMatches.replaceAt(at(j), static_cast<size_t>(i++));
        }
        while (i < j && CompareMatches(at(i), pivot, pDetail) <= 0)
        {
            ++i;
        }
        if (i < j)
        {
            vMatches.replaceAt(at(i), static_cast<size_t>(j--));
        }
    }
    vMatches.replaceAt(pivot, static_cast<size_t>(i));
    return i;
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
// ranked, and those of a store ordered by last contact in any order. False without memory.
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

// The order in which the matches were first found: split by split, candidate by candidate.
int OrderByDiscovery(android::Vector<_MatchResult>& vMatches, const uint16_t* pFirstSplits)
{
    const size_t uCount = vMatches.size();
    const std::unique_ptr<uint64_t[]> keys(new (std::nothrow) uint64_t[uCount]);
    const std::unique_ptr<_MatchResult[]> found(new (std::nothrow) _MatchResult[uCount]);
    if (keys == nullptr || found == nullptr)
    {
        return -1;
    }
    for (size_t i = 0; i < uCount; ++i)
    {
        keys[i] = (static_cast<uint64_t>(pFirstSplits[i]) << SPLIT_SHIFT) | i;
    }
    std::sort(keys.get(), keys.get() + uCount);
    std::copy_n(vMatches.array(), uCount, found.get());
    for (size_t i = 0; i < uCount; ++i)
    {
        vMatches.replaceAt(found[static_cast<uint32_t>(keys[i])], i);
    }
    return 0;
}

} // namespace

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
    // Kept aside, since ties are ordered from the order of discovery, not from the sorted one.
    Distribute(vMatches, places.get(), sorted.get());
    if (!HasTies(places.get(), sorted.get(), uCount, pDetail))
    {
        std::copy_n(sorted.get(), uCount, vMatches.editArray());
        return 0;
    }
    if (OrderByDiscovery(vMatches, pFirstSplits) != 0)
    {
        return -1;
    }
    CQVLocalizerManager::LocalResultQuickSort(vMatches, 0, static_cast<int>(uCount) - 1, pDetail);
    return 0;
}

int CQVLocalizerManager::AddToVector(android::Vector<_MatchResult>& vMatches, _MatchResult match)
{
    for (size_t i = 0; i < vMatches.size(); ++i)
    {
        if (vMatches[i].iIndex == match.iIndex)
        {
            vMatches.replaceAt(match, i);
            return 0;
        }
    }
    vMatches.push(match);
    return 0;
}

int CQVLocalizerManager::LocalResultQuickSort(android::Vector<_MatchResult>& vMatches, int iLow,
                                              int iHigh, tag_LocalizerDetail* pDetail)
{
    // Ranges do not meet again once they are parted, so the longer one can wait on a small stack.
    struct tag_Range
    {
        int iLow;
        int iHigh;
    };
    tag_Range aWaiting[RANGE_STACK_DEPTH];
    int iWaiting = 0;
    for (;;)
    {
        while (iLow < iHigh)
        {
            const int iPivot = PartitionMatches(vMatches, iLow, iHigh, pDetail);
            const bool bLeftLonger = iPivot - iLow > iHigh - iPivot;
            aWaiting[iWaiting++] =
                bLeftLonger ? tag_Range{iLow, iPivot - 1} : tag_Range{iPivot + 1, iHigh};
            iLow = bLeftLonger ? iPivot + 1 : iLow;
            iHigh = bLeftLonger ? iHigh : iPivot - 1;
        }
        if (iWaiting == 0)
        {
            return 1;
        }
        --iWaiting;
        iLow = aWaiting[iWaiting].iLow;
        iHigh = aWaiting[iWaiting].iHigh;
    }
}

void CQVLocalizerManager::LocalResultQuickSort(android::Vector<_MatchResult>& vMatches,
                                               tag_LocalizerDetail* pDetail)
{
    for (size_t i = 0; i < vMatches.size(); ++i)
    {
        for (size_t j = i; j < vMatches.size(); ++j)
        {
            if (CompareMatches(vMatches[j], vMatches[i], pDetail) < 0)
            {
                const _MatchResult earlier = vMatches[j];
                vMatches.replaceAt(_MatchResult(vMatches[i]), j);
                vMatches.replaceAt(earlier, i);
            }
        }
    }
}

int CQVLocalizerManager::LocalizerQuickSort(tag_ContactsStruct* pRecords, int iCount, int iSortType)
{
    if (iSortType == STORE_ORDER_TIME)
    {
        SortContacts(pRecords, iCount, SORT_TIME);
        return 0;
    }
    SortContacts(pRecords, iCount, SORT_NAME);
    for (int i = 0; pRecords != nullptr && i < iCount; ++i)
    {
        pRecords[i].iSortIndex = i;
    }
    return 0;
}
