#ifndef QV_LOCALIZERIMPL_STEPQUICKSORT_H
#define QV_LOCALIZERIMPL_STEPQUICKSORT_H

#include <algorithm>

// The quicksort that ranks matches. Which order equal items end in depends on its steps alone, so
// every caller goes through the same ones.

// Moves the items around the first one as a hole travels between the ends; returns where the first
// one came to stand.
template <typename Item, typename Compare>
int Partition(Item* pItems, int iLow, int iHigh, Compare compare)
{
    const Item pivot = pItems[iLow];
    int i = iLow;
    int j = iHigh;
    while (i < j)
    {
        while (j > i && compare(pItems[j], pivot) >= 0)
        {
            --j;
        }
        if (j > i)
        {
            pItems[i++] = pItems[j];
        }
        while (i < j && compare(pItems[i], pivot) <= 0)
        {
            ++i;
        }
        if (i < j)
        {
            pItems[j--] = pItems[i];
        }
    }
    pItems[i] = pivot;
    return i;
}

// Quicksort of items iLow..iHigh whose pivot is the first item; which order equal items end in
// depends on its steps alone. They leave a sorted range as it is, so it is not partitioned.
template <typename Item, typename Compare>
void QuickSort(Item* pItems, int iLow, int iHigh, Compare compare)
{
    // Ranges do not meet again once they are parted, so the longer one can wait on a small stack.
    struct tag_Range
    {
        int iLow;
        int iHigh;
    };
    constexpr int MOST_WAITING = 32; // each waiting range is at most half of the one before
    tag_Range aWaiting[MOST_WAITING];
    int iWaiting = 0;
    const auto before = [compare](const Item& a, const Item& b) { return compare(a, b) < 0; };
    for (;;)
    {
        while (iLow < iHigh && !std::is_sorted(pItems + iLow, pItems + iHigh + 1, before))
        {
            const int iPivot = Partition(pItems, iLow, iHigh, compare);
            const bool bLeftLonger = iPivot - iLow > iHigh - iPivot;
            aWaiting[iWaiting++] =
                bLeftLonger ? tag_Range{iLow, iPivot - 1} : tag_Range{iPivot + 1, iHigh};
            iLow = bLeftLonger ? iPivot + 1 : iLow;
            iHigh = bLeftLonger ? iHigh : iPivot - 1;
        }
        if (iWaiting == 0)
        {
            return;
        }
        --iWaiting;
        iLow = aWaiting[iWaiting].iLow;
        iHigh = aWaiting[iWaiting].iHigh;
    }
}

#endif
