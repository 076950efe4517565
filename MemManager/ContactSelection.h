#ifndef QV_MEMMANAGER_CONTACTSELECTION_H
#define QV_MEMMANAGER_CONTACTSELECTION_H

#include "Core/Records/CandidateFilter.h"
#include "Core/Records/ContactRecords.h"
#include "Core/Records/SearchRecords.h"

class CFilterChain;

// The two ways from contact records to the entries that a search looks through. Both give the
// same entries, in the records' order; they differ in what they may do with the records.
class CCandidateEntries
{
public:
    struct Counts
    {
        int iKept;    // records that pass the filters
        int iWritten; // those of them that the test does not rule out
    };

    // Writes an entry for each of the iCount records that passes the chain, which has to be one
    // that CRecordRule::CanTest accepts, and that pTest (may be null) does not rule out. The
    // records are only read, so they may lie in a mapping; pEntries has room for iCount entries.
    // With bEmptySlots records of contact id 0 are none: a writer that died left them.
    static Counts Select(const tag_ContactsStruct* pRecords, int iCount, bool bEmptySlots,
                         CFilterChain& chain, CCandidateFilter* pTest,
                         tag_LocalizerDetail* pEntries);

    // Takes the records of contact id 0 out of the copy.
    static void DropEmptySlots(tag_ContactsInfo* pCopy);

    // Narrows the caller's copy of the records by the pipeline of filter processes and makes the
    // entries of what is left, in a new array of pResult, which comes in empty. It stays empty
    // when nothing is left, a process fails or memory runs out.
    static void NarrowCopy(tag_ContactsInfo* pCopy, CFilterChain& chain,
                           tag_LocalizerResult* pResult);

    // The debug line that tells how many records the filters left.
    static void LogFilterResult(int iNum);
};

// Reads the store for one search.
class CContactSelection
{
public:
    // As CMemManger::CopyContactsResult, less the contacts that pTest (may be null) rules out.
    // With a chain whose processes write log lines all survivors of the filters stay in the set.
    // The set's array may have room for every stored contact; *pbDense tells whether at least
    // half of it is used, so that it may be handed on as it is.
    static void Copy(CFilterChain& chain, CCandidateFilter* pTest, tag_LocalizerResult** ppResult,
                     bool* pbDense);
};

#endif
