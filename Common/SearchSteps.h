#ifndef QV_COMMON_SEARCHSTEPS_H
#define QV_COMMON_SEARCHSTEPS_H

// The binary search, independent of the elements: the sorter runs it on an array of records, a
// patch of the store on records that are still to be moved into the order searched. Both find the
// same one of several equal elements.
//
// TArray offers, for a key and indexes of its sorted elements:
//   bool KeyEquals(int i)
//   bool KeyBefore(int i)   the key sorts before element i
//   bool KeyBehind(int i)   the key sorts behind element i

// Halves 0..iCount - 1: the index of an equal element (then *pbFound is true), or the place where
// the key belongs.
template <class TArray>
int SearchHalves(TArray& array, int iCount, bool* pbFound)
{
    int lo = 0;
    int hi = iCount - 1;
    while (lo <= hi)
    {
        const int mid = lo + (hi - lo) / 2;
        if (array.KeyEquals(mid))
        {
            *pbFound = true;
            return mid;
        }
        if (array.KeyBefore(mid))
        {
            hi = mid - 1;
        }
        else
        {
            lo = mid + 1;
        }
    }
    return hi + 1;
}

// The index 0..iCount at which the key keeps the order.
template <class TArray>
int SearchPlace(TArray& array, int iCount)
{
    if (iCount <= 1)
    {
        return iCount == 1 && !array.KeyBefore(0) ? 1 : 0;
    }
    if (!array.KeyBehind(0))
    {
        return 0;
    }
    if (!array.KeyBefore(iCount - 1))
    {
        return iCount;
    }
    bool bFound = false;
    return SearchHalves(array, iCount, &bFound);
}

#endif
