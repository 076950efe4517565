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
    // The set's array may have room for every stored contact; *pbDense tells whether at least
    // half of it is used, so that it may be handed on as it is.
    static void Copy(CFilterChain& chain, CCandidateTest* pTest, tag_LocalizerResult** ppResult,
                     bool* pbDense);
};

#endif
