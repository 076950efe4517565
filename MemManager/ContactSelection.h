#ifndef QV_MEMMANAGER_CONTACTSELECTION_H
#define QV_MEMMANAGER_CONTACTSELECTION_H

#include "Core/Records/CandidateFilter.h"
#include "Core/Records/ContactRecords.h"
#include "Core/Records/SearchRecords.h"

class CFilterChain;

// The two ways from contact records to a search's candidate set. Both give the same entries, in
// the records' order; they differ in what they may do with the records.
class CCandidateEntries
{
public:
    struct Counts
    {
        int iKept;    // records that pass the filters
        int iWritten; // those of them that the test accepts
    };

    // Writes an entry for each of the iCount records that passes the chain, which has to be one
    // that CRecordRule::CanTest accepts, and that pTest (may be null) accepts. The records are only
    // read, so they may lie in a mapping; pEntries has room for iCount entries. With bEmptySlots,
    // records of contact id 0, which a writer that died leaves, are skipped.
    static Counts Select(const tag_ContactsStruct* pRecords, int iCount, bool bEmptySlots,
                         CFilterChain& chain, CCandidateFilter* pTest,
                         tag_LocalizerDetail* pEntries);

    // Removes the records of contact id 0 from the copy.
    static void DropEmptySlots(tag_ContactsInfo* pCopy);

    // Narrows the caller's copy of the records by the pipeline of filter processes and makes the
    // entries of what is left, in a new array of pResult, which must be empty. It stays empty when
    // nothing is left, a process fails or an allocation fails.
    static void NarrowCopy(tag_ContactsInfo* pCopy, CFilterChain& chain,
                           tag_LocalizerResult* pResult);

    // Writes the debug line with the number of records that passed the filters.
    static void LogFilterResult(int iNum);
};

// Reads the store for one search.
class CContactSelection
{
public:
    // As CMemManger::CopyContactsResult, without the contacts that pTest (may be null) rejects; a
    // chain that works on a copy of the records keeps these. The set's array may have room for
    // every stored contact; *pbDense tells whether at least half of it is used, so that it can be
    // handed on as it is.
    static void Copy(CFilterChain& chain, CCandidateFilter* pTest, tag_LocalizerResult** ppResult,
                     bool* pbDense);
};

#endif
