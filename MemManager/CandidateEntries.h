#ifndef QV_MEMMANAGER_CANDIDATEENTRIES_H
#define QV_MEMMANAGER_CANDIDATEENTRIES_H

// The two ways from contact records to the entries that a search looks through. Both give the
// same entries, in the records' order; they differ in what they may do with the records.

#include "Core/ContactRecords.h"
#include "Core/SearchRecords.h"
#include "MemManager/CandidateTest.h"

class CFilterChain;

class CCandidateEntries
{
public:
    struct Counts
    {
        int iKept;    // records that pass the filters
        int iWritten; // those of them that the test does not rule out
    };

    // Writes an entry for each of the iCount records that passes the chain, which has to be one
    // that CRecordTest::CanTest accepts, and that pTest (may be null) does not rule out. The
    // records are only read, so they may lie in a mapping; pEntries has room for iCount entries.
    // With bEmptySlots records of contact id 0 are none: a writer that died left them.
    static Counts Select(const tag_ContactsStruct* pRecords, int iCount, bool bEmptySlots,
                         CFilterChain& chain, CCandidateTest* pTest, tag_LocalizerDetail* pEntries);

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

#endif
