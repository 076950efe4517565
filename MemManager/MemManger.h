#ifndef QV_MEMMANAGER_MEMMANGER_H
#define QV_MEMMANAGER_MEMMANGER_H

// The store manager: the contact index in its two shared files, and the result sets that searches
// read and return.
//
// The files are the state and outlive every object; each operation maps them anew, so it reads what
// the last writer of any process wrote. An object holds only what a patch in place has open. One
// object is used by one caller at a time; processes exclude each other by the store lock. The lock
// belongs to one open of the lock file: while an object holds it through LockMemo, the operations
// that take it themselves (InitContactRecord, GetContactsResult, CopyContactsResult) are refused,
// in the same process too.
//
// Registration record. Every writer follows the protocol of StoreRegister.h: the capacity iMemSize
// is 0, the mark (dirty flag), from before the first record changes until the change is complete
// and on the disk. A writer that dies in between leaves one of these states, none of which can harm
// a reader, because iTotalNum never exceeds the file and every slot holds one complete contact or,
// with the contact id 0, none:
//  - a longer records file under the old record: the complete old index;
//  - marked, with the old iTotalNum over old and new records: an index in which contacts may be
//    missing or appear twice;
//  - marked, with the new iTotalNum: the complete new index.
// In the last two the next notification of changed contacts or status rebuilds the store, because
// iTotalNum, or the database's count if iTotalNum is 0, exceeds iMemSize. Readers under the lock
// see the first two only after a writer died, the third also while a writer waits for the disk;
// GetMemSize and GetSortType take no lock and may also see the mark while a change is under way. A
// damaged record acts like a file that cannot be mapped, with an error line.
//
// Result sets. A set made here is one object from scalar new and, if it has entries, one array
// from array new; no two sets share an array. The receiver releases a set with FreeSearchResult.

#include "Common/Export.h"
#include "Core/Records/ContactRecords.h"
#include "Core/Records/SearchRecords.h"
#include "MemManager/Files/SingleMutex.h"

class CFilterChain;

// The store manager; the comment at the top of this file is its contract.
class QV_EXPORT CMemManger
{
public:
    CMemManger();
    // Closes open write mappings and releases a held lock.
    ~CMemManger();
    CMemManger(const CMemManger&) = delete;
    CMemManger& operator=(const CMemManger&) = delete;

    // The store's capacity in records; *piTotalNum (may be null) gets the stored count. 0 with
    // *piTotalNum untouched when there is no store or it is damaged. No lock.
    int GetMemSize(int* piTotalNum);

    // Opens both files for a patch in place; the caller holds the lock through LockMemo.
    // *ppContacts covers iMemSize records (null when that is 0), *ppReg the registration record,
    // which is created with zeros if missing. Both stay owned by this object and valid until
    // CloseWriteShareMem. 0, or -1 with the pointers untouched and no mapping kept: a null
    // argument, a damaged record (no file is changed then), a file that cannot be mapped.
    int OpenWriteShareMem(tag_ContactsStruct** ppContacts, tag_ContactReg** ppReg);
    // Closes what OpenWriteShareMem opened, without waiting for the disk.
    void CloseWriteShareMem();

    // The store lock, held through this object. LockMemo does not wait: 1 when taken; 0 when it
    // cannot be taken or this object holds it already, and goes on holding it. UnlockMemo: 1 when
    // released, 0 when nothing was held or the release failed (the handle is kept; the next
    // LockMemo drops it if it is no longer the lock file's). The library itself calls TryLockMemo.
    int LockMemo();
    int UnlockMemo();
    // As LockMemo, but tells a lock that is held from one that cannot be opened.
    QV_INTERNAL LOCK_RESULT TryLockMemo();

    // The stored sort type, 0 when there is no store or it is damaged. No lock.
    int GetSortType();
    // Stores a sort type of any value, with capacity 0, so that the next change rebuilds the
    // store in that order, and waits for the disk. Stored records stay as they are. Without a
    // store, or with a damaged one, nothing is changed or created. No lock.
    void SetSortType(int iSortType);

    // A set of the entries of g_specialNumberRecords, whatever the store holds; empty if the
    // array's allocation fails, null if the set's does. No lock. Null ppResult: nothing.
    void CopySpecialNumberRecord(tag_LocalizerResult** ppResult);

    // Makes *pPage a view of iCount entries of pSrc from entry iStart on. The page owns nothing,
    // is not released and is valid as long as pSrc lives. 0, or -1 with the page untouched: a
    // null argument, iStart outside the set (also for an empty set), a negative start or count,
    // entries beyond the set's end.
    int GetSearchRecord(tag_LocalizerResult* pSrc, int iStart, int iCount,
                        tag_LocalizerResult* pPage);

    // Index of the first entry with the id, 0 when no entry has it, -1 when pSrc is null.
    int GetIndexByContactsId(tag_LocalizerResult* pSrc, long iContactID);

    // Adds the entries per index character to the caller's 27 counters. In time order (stored sort
    // type 1) the first 6 count: '1' to '5', then all others; else all 27: 'A' to 'Z', then all
    // others. The order is read without the lock at the time of the call, so there are always 27.
    // 0, or -1 when an argument is null.
    int GetFirstWordInfo(tag_LocalizerResult* pSrc, int* piCounts);

    // Releases a set and its entries. 0, or -1 when pSrc is null.
    int FreeSearchResult(tag_LocalizerResult* pSrc);

    // A chain of filters from iNum pairs of kind and id, owned by the caller; see
    // Filter/FilterChainBuilder.h.
    int CreateFilterChain(int* piType, QVLong32* plID, int iNum, CFilterChain** ppChain);

    // --- For callers outside: nothing in the library calls these ---

    // Writes a whole new store under the store lock, with room for STORE_SPARE_RECORDS more
    // contacts: the records first, the registration record last. The stored sort type is kept (0
    // for a new or damaged record). With pContacts null only the registration record is written.
    // Five attempts at the lock, 200 ms apart. The records are flushed to the disk, without the
    // store lock, before the capacity is set.
    // 0, or -1: pInfo null, a count below 0 or above what the store can hold, no lock, a
    // registration record that cannot be read (its sort type would be lost), a file that cannot
    // be mapped or flushed. When the records file cannot be mapped, the old index stays as it
    // was; when a later step fails, the new records may lie under the old registration record,
    // which is marked. The store also stays marked, with 0, when the sort type is set meanwhile.
    int InitContactRecord(tag_ContactsInfo* pInfo);

    // Copies all stored records under the store lock. Waits for the lock without limit (one error
    // line and 100 ms per attempt); if its file cannot be opened, gives up after five attempts. The
    // set is empty when the lock was given up, there is no store, it is damaged or cannot be
    // mapped, or the array's allocation fails; null when the set's allocation fails. The caller
    // releases the array with array delete and the set with scalar delete. Null ppInfo: nothing.
    void GetContactsResult(tag_ContactsInfo** ppInfo);

    // The stored contacts that pass every filter of the chain, as a set of entries in the store's
    // order. Five attempts at the lock, 200 ms apart, with an error line each. The lock is held
    // while the records are read, once and in order: entries are made straight from the mapping,
    // which takes no longer than copying the records. Chains whose filters write log lines (kinds 9
    // and 11) or are of an unknown kind work on a copy, filtered after the lock is released. The
    // set is empty when the lock was refused, there is no store, it is damaged or cannot be mapped,
    // or an allocation fails; null when the set's allocation fails. Null ppResult: nothing.
    void CopyContactsResult(CFilterChain& chain, tag_LocalizerResult** ppResult);

    // A set with as many entries as pSrc, all zero (New), or with a copy of pSrc's entries (Copy).
    // 0, or -1: a null argument, or a failed allocation (*ppNew or
    // *ppOut is then null).
    int NewSearchResult(tag_LocalizerResult* pSrc, tag_LocalizerResult** ppNew);
    int CopySearchResult(tag_LocalizerResult* pSrc, tag_LocalizerResult** ppOut);

    // Does nothing; 0.
    int UpdateContactRecord(tag_ContactsInfo* pInfo);

private:
    tag_ContactReg* m_pContactReg = nullptr;
    tag_ContactsStruct* m_pContacts = nullptr;
    int m_hMemLock = 0;
    int m_iContactsMapSize = 0; // bytes of the m_pContacts mapping
};
static_assert(sizeof(void*) != 4 || sizeof(CMemManger) == 16, "part of the interface");

#endif
