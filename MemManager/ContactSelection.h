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
    // *pbExact tells whether the set's array has room for exactly the entries it holds; otherwise
    // it may have room for every stored contact.
    static void Copy(CFilterChain& chain, CCandidateTest* pTest, tag_LocalizerResult** ppResult,
                     bool* pbExact);
};

#endif
