#ifndef QV_MEMMANAGER_MEMMANGER_H
#define QV_MEMMANAGER_MEMMANGER_H

// The store manager: the contact index in its two shared files, and the result sets that searches
// are built from and hand back.
//
// The files are the state and outlive every object; each operation maps them afresh, so what one
// process wrote is what the next one reads. An object holds only what a patch in place has open.
// One object is used by one caller at a time; processes exclude each other by the store lock.
// The lock belongs to one open of the lock file: while an object holds it through LockMemo, the
// operations that take it themselves (InitContactRecord, GetContactsResult, CopyContactsResult)
// cannot have it, in the same process neither.
//
// Registration record. Whoever changes stored records follows the protocol of StoreRegister.h: the
// capacity iMemSize is 0, the mark, from before the first record changes until the change is
// complete and on the disk. A writer that dies in between leaves one of these states, none of which
// can harm a reader, because iTotalNum never exceeds the file and every slot holds one contact,
// whole, or, with the contact id 0, none:
//  - a longer records file under the old record: the old index, whole;
//  - marked, with the old iTotalNum over old and new records: an index that may miss a contact or
//    show it twice;
//  - marked, with the new iTotalNum: the new index, whole.
// In the last two the next notification of changed contacts or status rebuilds the store, because
// iTotalNum, or the database's count where iTotalNum is 0, exceeds iMemSize. Readers under the lock
// meet the first two only after a writer died, the third also while it waits for the disk;
// GetMemSize and GetSortType take no lock and may also see the mark while a change is under way. A
// damaged record acts like a file that cannot be mapped, with an error line.
//
// Result sets. A set made here is one object from scalar new and, when it has entries, one array
// from array new; no two sets share an array. The receiver releases a set with FreeSearchResult.

#include "Common/Export.h"
#include "Core/Records/ContactRecords.h"
#include "Core/Records/SearchRecords.h"
#include "MemManager/Files/SingleMutex.h"

class CFilterChain;

// The store manager; this file begins with what it promises.
class QV_EXPORT CMemManger
{
public:
    CMemManger();
    // Closes open write mappings and releases a held lock.
    ~CMemManger();
    CMemManger(const CMemManger&) = delete;
    CMemManger& operator=(const CMemManger&) = delete;

    // Writes a whole new store under the store lock, with room for STORE_SPARE_RECORDS more
    // contacts: the records first, the registration record last. The sort type stays what
    // GetSortType tells (0 for a new or damaged record). With pContacts null only the
    // registration record is written. Five attempts at the lock, 200 ms apart. The records are on
    // the disk before the registration record tells of them.
    // 0, or -1: pInfo null, a count below 0 or above what the store can hold, no lock, a
    // registration record that cannot be read (its sort type would be lost), a file that cannot
    // be mapped or flushed. When the records file cannot be mapped, the old index stays as it
    // was; when a later step fails, the new records may lie under the old registration record,
    // which is marked. It also ends marked, with 0, when the sort type is set meanwhile.
    int InitContactRecord(tag_ContactsInfo* pInfo);

    // Hands out a copy of all stored records, made under the store lock, which is waited for
    // without limit (one error line and 100 ms per attempt), unless its file cannot be opened. The
    // set is empty when there is no store, it is damaged or memory ran out, and null when even the
    // set could not be allocated. The caller releases the array with array delete and the set with
    // scalar delete. Null ppInfo: nothing is done.
    void GetContactsResult(tag_ContactsInfo** ppInfo);

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

    // The store lock, held through this object. LockMemo does not wait: 1 when taken, 0 when
    // anybody holds it, this object included, which then goes on holding it. UnlockMemo: 1 when
    // released, 0 when nothing was held or the release failed (the handle is kept then; LockMemo
    // gives it up when it is not the lock any more).
    int LockMemo();
    int UnlockMemo();
    // As LockMemo, telling a lock that somebody holds from one that cannot be had.
    QV_INTERNAL LOCK_RESULT TryLockMemo();

    // The stored sort type, 0 when there is no store or it is damaged. No lock.
    int GetSortType();
    // Stores a sort type of any value, with capacity 0, so that the next change rebuilds the
    // store in that order, and waits for the disk. Stored records stay as they are. Without a
    // store, or with a damaged one, nothing is changed or created. No lock.
    void SetSortType(int iSortType);

    // Does nothing; 0.
    int UpdateContactRecord(tag_ContactsInfo* pInfo);

    // The stored contacts that pass every filter of the chain, as a set of entries in the
    // store's order. Five attempts at the lock, 200 ms apart, with an error line each. The lock is
    // held while the records are read, once and in order: entries are made where the records lie,
    // which takes no longer than copying them out. Only for chains whose filters write log lines
    // (kinds 9 and 11) the records are copied, and filtered after the lock is released. The set
    // is empty when there is no store, it is damaged, the lock was refused or memory ran out,
    // and null when the set could not be allocated. Null ppResult: nothing is done.
    void CopyContactsResult(CFilterChain& chain, tag_LocalizerResult** ppResult);

    // A set of the entries of g_specialNumberRecords, whatever the store holds; empty or null
    // when memory ran out. No lock. Null ppResult: nothing is done.
    void CopySpecialNumberRecord(tag_LocalizerResult** ppResult);

    // A set with as many entries as pSrc, all zero (New), or with a copy of pSrc's entries (Copy).
    // 0, or -1: a null argument, or no memory (null is stored then).
    int NewSearchResult(tag_LocalizerResult* pSrc, tag_LocalizerResult** ppNew);
    int CopySearchResult(tag_LocalizerResult* pSrc, tag_LocalizerResult** ppOut);

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

private:
    tag_ContactReg* m_pContactReg = nullptr;
    tag_ContactsStruct* m_pContacts = nullptr;
    int m_hMemLock = 0;
    int m_iContactsMapSize = 0; // bytes of the m_pContacts mapping
};
static_assert(sizeof(void*) != 4 || sizeof(CMemManger) == 16, "part of the interface");

#endif
