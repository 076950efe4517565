// The ranking of matches and the order of stored records.

#include "LocalizerImpl/ContactSort.h"
#include "LocalizerImpl/QVLocalizerManager.h"
#include "LocalizerImpl/RankingOrder.h"

#include <algorithm>
#include <iterator>
#include <memory>
#include <new>

namespace
{

constexpr int POSITION_BITS = 16;
constexpr uint32_t POSITION_MASK = 0xFFFF;
constexpr int SPLIT_SHIFT = 32; // a discovery key: split above, place in the vector below
constexpr int RANGE_STACK_DEPTH = 32;

// Kind, start and span of a match from one search: starts are 0..9, spans 1..10.
constexpr int BUCKET_POSITION_BITS = 4;
constexpr int BUCKET_COUNT = (MATCH_INITIALS + 1) << (2 * BUCKET_POSITION_BITS);

uint32_t StartOf(const _MatchResult& match)
{
    return static_cast<uint32_t>(match.iMatchPos) >> POSITION_BITS;
}

uint32_t EndOf(const _MatchResult& match)
{
    return static_cast<uint32_t>(match.iMatchPos) & POSITION_MASK;
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
    constexpr uint32_t FIELD = (1U << BUCKET_POSITION_BITS) - 1;
    const uint32_t uKind = static_cast<uint32_t>(MATCH_INITIALS - match.iMatchType);
    const uint32_t uStart = StartOf(match) & FIELD;
    const uint32_t uSpan = (FIELD - (EndOf(match) - StartOf(match))) & FIELD;
    return static_cast<int>((((uKind << BUCKET_POSITION_BITS) | uStart) << BUCKET_POSITION_BITS) |
                            uSpan);
}

// Distributes the matches over kind, start and span; inside a bucket they keep their order.
void Distribute(const android::Vector<_MatchResult>& vMatches, _MatchResult* pSorted,
                size_t (&aBucketEnds)[BUCKET_COUNT])
{
    std::fill(std::begin(aBucketEnds), std::end(aBucketEnds), 0);
    for (size_t i = 0; i < vMatches.size(); ++i)
    {
        ++aBucketEnds[BucketOf(vMatches[i])];
    }
    size_t uStart = 0;
    for (size_t& uEnd : aBucketEnds)
    {
        const size_t uCount = uEnd;
        uEnd = uStart;
        uStart += uCount;
    }
    for (size_t i = 0; i < vMatches.size(); ++i)
    {
        pSorted[aBucketEnds[BucketOf(vMatches[i])]++] = vMatches[i];
    }
}

// Sorts each bucket by place in name order, which is how most candidate sets come already.
void SortBuckets(_MatchResult* pSorted, const size_t (&aBucketEnds)[BUCKET_COUNT],
                 const tag_LocalizerDetail* pDetail)
{
    const auto before = [pDetail](const _MatchResult& a, const _MatchResult& b)
    { return pDetail[a.iIndex].iSortIndex < pDetail[b.iIndex].iSortIndex; };
    size_t uStart = 0;
    for (const size_t uEnd : aBucketEnds)
    {
        if (!std::is_sorted(pSorted + uStart, pSorted + uEnd, before))
        {
            std::sort(pSorted + uStart, pSorted + uEnd, before);
        }
        uStart = uEnd;
    }
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
    const std::unique_ptr<_MatchResult[]> sorted(new (std::nothrow) _MatchResult[uCount]);
    if (sorted == nullptr)
    {
        return -1;
    }
    // Kept aside, since ties are ordered from the order of discovery, not from the sorted one.
    size_t aBucketEnds[BUCKET_COUNT];
    Distribute(vMatches, sorted.get(), aBucketEnds);
    SortBuckets(sorted.get(), aBucketEnds, pDetail);
    const auto tied = [pDetail](const _MatchResult& a, const _MatchResult& b)
    { return CompareMatches(a, b, pDetail) == 0; };
    if (std::adjacent_find(sorted.get(), sorted.get() + uCount, tied) == sorted.get() + uCount)
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
