#ifndef QV_MEMMANAGER_STOREBUILD_H
#define QV_MEMMANAGER_STOREBUILD_H

#include "Core/Records/ContactRecords.h"

enum BUILD_RESULT
{
    BUILD_FAILED = -1,
    BUILD_DONE = 0,
    BUILD_OUT_OF_ORDER = 1 // written and left marked: the sort type was set meanwhile
};

// Writes a whole new store.
class CStoreBuild
{
public:
    // Writes info's records, sorted by *piSortedBy, or by the stored sort type when it is null.
    // What is stored, kept and logged: see CMemManger::InitContactRecord.
    static BUILD_RESULT Write(const tag_ContactsInfo& info, const int* piSortedBy);
};

#endif
