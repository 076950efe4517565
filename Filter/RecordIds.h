#ifndef QV_FILTER_RECORDIDS_H
#define QV_FILTER_RECORDIDS_H

#include "Core/Records/ContactRecords.h"

// The id lists of contact records: at most iNum ids, ending at the first 0. A damaged record's list
// without a 0 is not read beyond iNum. A null list is empty.

// Whether iID is in the list. Each element is compared before it can end the list, so 0 is in every
// list that ends at a 0.
inline bool IsInIdList(int iID, const QVLong32* plList, int iNum)
{
    for (int i = 0; plList != nullptr && i < iNum; ++i)
    {
        if (plList[i] == iID)
        {
            return true;
        }
        if (plList[i] == 0)
        {
            return false;
        }
    }
    return false;
}

// How many ids the list has.
inline int CountIds(const QVLong32* plList, int iNum)
{
    int iCount = 0;
    while (plList != nullptr && iCount < iNum && plList[iCount] != 0)
    {
        ++iCount;
    }
    return iCount;
}

#endif
