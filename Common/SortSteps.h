#ifndef QV_COMMON_SORTSTEPS_H
#define QV_COMMON_SORTSTEPS_H

#include <utility>

// The record sort, independent of the elements: the sorter runs it on whole records, the index
// build on small keys. Both make the same comparisons and moves in the same sequence, so records
// that compare equal end in the same order.
//
// TArray offers, for indexes of its elements:
//   bool Greater(int a, int b)      element a sorts behind element b
//   void Swap(int a, int b)
//   void Hold(int a)                sets a copy of element a aside
//   bool LessThanHeld(int a)        element a sorts before the held one
//   bool GreaterThanHeld(int a)     element a sorts behind the held one
//   void Move(int from, int to)     copies an element over another
//   void Release(int a)             puts the held element at a

// A range with this distance between its ends, or more, is partitioned.
constexpr int SORT_PARTITION_DISTANCE = 5;

// Pending ranges: the larger half of each partition waits, so each entry is at most half as long
// as the one below it.
constexpr int SORT_STACK_DEPTH = 32;

template <class TArray>
void SortMedianOfThree(TArray& array, int lo, int mid, int hi)
{
    if (array.Greater(lo, mid))
    {
        array.Swap(lo, mid);
    }
    if (array.Greater(lo, hi))
    {
        array.Swap(lo, hi);
    }
    if (array.Greater(mid, hi))
    {
        array.Swap(mid, hi);
    }
}

// Splits lo..hi around a pivot; returns {last index of the left part, first of the right part}.
template <class TArray>
std::pair<int, int> SortPartition(TArray& array, int lo, int hi)
{
    const int mid = lo + (hi - lo) / 2;
    SortMedianOfThree(array, lo, mid, hi);
    array.Swap(mid, hi - 1);
    array.Hold(hi - 1);
    int i = lo;
    int j = hi - 1;
    for (;;)
    {
        while (i + 1 <= hi && array.LessThanHeld(i + 1))
        {
            ++i;
        }
        do
        {
            --j;
        } while (j >= i + 1 && array.GreaterThanHeld(j));
        if (j < i + 1)
        {
            break;
        }
        array.Swap(i + 1, j);
        ++i;
    }
    array.Swap(i + 1, hi - 1);
    return {j, i + 2};
}

// Brings lo..hi into order up to runs of SORT_PARTITION_DISTANCE records.
template <class TArray>
void SortPartitions(TArray& array, int lo, int hi)
{
    std::pair<int, int> pending[SORT_STACK_DEPTH];
    int iDepth = 0;
    if (lo < 0 || hi < 0)
    {
        return;
    }
    for (;;)
    {
        while (hi - lo >= SORT_PARTITION_DISTANCE)
        {
            const std::pair<int, int> split = SortPartition(array, lo, hi);
            // The halves are independent; sorting the shorter one first bounds the stack.
            if (split.first - lo < hi - split.second)
            {
                pending[iDepth++] = {split.second, hi};
                hi = split.first;
            }
            else
            {
                pending[iDepth++] = {lo, split.first};
                lo = split.second;
            }
        }
        if (iDepth == 0)
        {
            return;
        }
        --iDepth;
        lo = pending[iDepth].first;
        hi = pending[iDepth].second;
    }
}

template <class TArray>
void SortInsertions(TArray& array, int lo, int hi)
{
    for (int k = lo + 1; k <= hi; ++k)
    {
        array.Hold(k);
        int iGap = k;
        while (iGap > lo && array.GreaterThanHeld(iGap - 1))
        {
            array.Move(iGap - 1, iGap);
            --iGap;
        }
        if (iGap != k)
        {
            array.Release(iGap);
        }
    }
}

#endif
