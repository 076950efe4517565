#ifndef QV_MEMMANAGER_CONTACTSELECTION_H
#define QV_MEMMANAGER_CONTACTSELECTION_H

#include "Core/SearchRecords.h"
#include "MemManager/CandidateTest.h"

class CFilterChain;

// Reads the store for one search.
class CContactSelection
{
public:
    // As CMemManger::CopyContactsResult, less the contacts that pTest (may be null) rules out.
    // With a chain whose processes write log lines all survivors of the filters stay in the set.
    // The set's array may have room for more entries than it holds.
    static void Copy(CFilterChain& chain, CCandidateTest* pTest, tag_LocalizerResult** ppResult);
};

#endif
