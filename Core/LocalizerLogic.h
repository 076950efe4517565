#ifndef QV_CORE_LOCALIZERLOGIC_H
#define QV_CORE_LOCALIZERLOGIC_H

#include "Common/Export.h"
#include "Core/Records/ContactRecords.h"
#include "Core/Records/SearchRecords.h"

class CCandidateFilter;
class CDBOperator;
class CFilterChain;
class CMemManger;
class CResultOwner;
class CStopwatch;

extern "C"
{
    // 1 when the shared index must be built: the pinyin mapping or the registration record is
    // missing or empty; else 0. Takes no lock.
    QV_EXPORT int IsNeedReload();
}

// The library's entry: builds the shared index, searches it and keeps it current.
//
// Call order: construct; MemInit once; then searches, result operations and change notifications
// in any order; FreeSearchResult for every set received; destroy. Calls on one object come one at
// a time. The index belongs to no object: it outlives the process, and every process that loads
// the library reads the same one.
//
// Side effects: MemInit that builds, Search without pLastResult (special numbers apart),
// SetSortType and the change notifications set the process's file-creation mask to 0 and leave it.
// The files have the permission bits 0777; the directory's mode, usually 0700, protects them. A
// build opens the pinyin table for writing too, but changes nothing in it.
//
// Results: 0, or -1 for a null argument, a refused lock, a file that cannot be mapped, a database
// that cannot be read or a failed allocation; LOC_ERR_MAP and LOC_ERR_PARAM of
// Core/Records/LocalizerCodes.h from the pinyin operations and the search itself.
class QV_EXPORT CLocalizerLogic
{
public:
    // Opens no file. If an allocation fails, MemInit cannot build and Search may return -1; nothing
    // else may be called then.
    CLocalizerLogic();
    ~CLocalizerLogic();
    CLocalizerLogic(const CLocalizerLogic&) = delete;
    CLocalizerLogic& operator=(const CLocalizerLogic&) = delete;

    // Builds the whole index from the provider's database, unless bForce is false and the index is
    // complete; one that is missing, marked, damaged or unreadable is built. The database is read
    // without the store lock; the lock is held while the files are written, after at most five
    // attempts 200 ms apart. The stored sort type is kept. The online state may fail to be read:
    // that is logged and ignored. LOC_ERR_MAP if the pinyin table is missing or cannot be copied.
    // After a failure the old index stays.
    int MemInit(bool bForce);

    // One search, within pLastResult (read only, stays the caller's) or, when it is null, within
    // all contacts that pass pFilterChain, or for IME_SEARCH_SPECIAL within the special numbers.
    // pFilterChain is never null, also where it is not used.
    //   szInput    at most 10 characters; its letters become lowercase and its Chinese characters
    //              their codes, in place, also in a search that fails afterwards
    //   ppResult   gets a new set, released with FreeSearchResult: the matches, best first; null
    //              if only its allocation failed; untouched after any earlier failure. If that
    //              allocation fails or ppResult itself is null, the result is -1 and pMask and
    //              szWordOut are written all the same
    //   pMask      gets the keys that can follow: bits 0..25 letters, 0x4000000 anything else
    //   szWordOut  at least 20 wide characters, zeroed: gets the Chinese characters that the last
    //              letters may stand for, without terminator
    // iReserved is not used. The set is empty if the store lock was refused five times (for a
    // second) or there is no index. A search type outside 0..2: 0, with nothing written.
    int Search(tag_LocalizerResult* pLastResult, wchar_t* szInput, IME_SEARCH_TYPE eSearchType,
               CFilterChain* pFilterChain, int iReserved, tag_LocalizerResult** ppResult,
               long* pMask, wchar_t* szWordOut);

    // Pass-through to CQVLocalizerManager (LocalizerImpl/QVLocalizerManager.h).
    int GetLocalizer(wchar_t* szDisplayName, wchar_t* szOut); // GetLocalizerChars
    int GetLocalizerBatch(tag_ContactsInfo* pInfo);
    int GetLocalizerString(wchar_t* szInput, int iPos, wchar_t* szWord, wchar_t* szOut);
    int GetLocalizerString(long hMap, wchar_t* szDisplayName, wchar_t* szOut);
    long CreatePinYinFileMapping();
    int ReleasePinYinFileMapping(long hMap);

    // Pass-through to CMemManger (MemManager/MemManger.h).
    int GetSearchResult(tag_LocalizerResult* pResult, int iStart, int iCount,
                        tag_LocalizerResult* pPage); // GetSearchRecord
    int FreeSearchResult(tag_LocalizerResult* pResult);
    int GetFirstWordInfo(tag_LocalizerResult* pResult, int* piCounts);
    int GetIndexByContactsId(tag_LocalizerResult* pResult, long iContactID);
    int CreateFilterChain(int* piType, QVLong32* plID, int iNum, CFilterChain** ppChain);
    void SetSortType(int iSortType);
    int GetSortType();

    // Change notifications of the provider, after its change is in the database. They wait for
    // the store lock without limit while somebody holds it (one error line per refused attempt),
    // except for a rebuild, which gives up like MemInit; a lock file that cannot be opened is
    // given up after five attempts. A missing store is built by notifications of contacts and
    // status, if the database has contacts, and by no other. Only one process at a time changes the
    // database, sends notifications and calls SetSortType and MemInit; any may search meanwhile.
    //
    // A change that fails leaves the store marked (dirty: capacity 0); if the mark cannot be
    // written, this process remembers the change. The next notification of contacts or status then
    // rebuilds the store, as it does with one that a killed process left unfinished or that is
    // damaged; notifications of times and stars repair nothing.

    // Rebuilds the store from the database in the stored order. The pinyin table stays as it is,
    // unless there is no store yet.
    void OnContactsTableChanged();
    // The iRecordNum contacts of pIds were added, changed or removed. Contacts that are added or
    // removed together are named in one call: the stored count becomes the database's. The array
    // is modified: ids found in the store are removed, the last one moving into each gap. The
    // store is rebuilt instead of patched when its capacity is too small or it is marked, the
    // database cannot be counted, or the reader cannot list all ids (more than 200, more text than
    // it takes, ids beyond 32 bits). Patched contacts have no online bit until the next
    // notification of status. Null pIds or a count of 0 or less: nothing.
    void OnContactsTableChanged(int iRecordNum, long long* pIds);
    // Who is online changed: sets and clears the bits of all contacts in place. The arguments are
    // not used. When who is online cannot be read, the bits stay.
    void OnStatusUpdatesTableChanged(int iRecordNum, long long* pIds);
    // The contact was contacted at llTime, in milliseconds since 1970: stores the time, counts
    // one more contact and, in a store in time order, makes it the first. Contacts that are not
    // stored change nothing.
    void OnContactTimeChanged(long iContactID, long long llTime);
    // The contact became a favourite (1) or ceased to be one (any other value).
    void OnContactStarChanged(long iContactID, long lStarred);
    // The stored sort type, read from the file; 0 when there is no store or it is damaged.
    int OnGetSortType();

    // Whether all allocations of the constructor succeeded.
    QV_INTERNAL bool IsReady() const
    {
        return m_pclMemManger != nullptr && m_pDBOperator != nullptr;
    }

private:
    QV_INTERNAL int BuildIndex(tag_ContactsInfo& record);
    QV_INTERNAL int ReadContacts(tag_ContactsInfo& record);
    QV_INTERNAL void ReadOnlineStatus(tag_ContactsInfo& record);
    QV_INTERNAL static int ReadStoredOrder(int& iSortType);
    QV_INTERNAL static int ConvertAndSort(tag_ContactsInfo& record, int iSortType);
    QV_INTERNAL static int SortConverted(tag_ContactsInfo& record, int iSortType);
    QV_INTERNAL static int WriteSorted(tag_ContactsInfo& record, int iSortType);
    QV_INTERNAL void CopySource(IME_SEARCH_TYPE eSearchType, CFilterChain& chain,
                                CCandidateFilter& test, CResultOwner& copy);
    QV_INTERNAL int RebuildStore(tag_ContactsInfo& record);
    QV_INTERNAL bool HasRoomForAll(int& iDatabaseCount);
    QV_INTERNAL bool PatchStore(int iDatabaseCount, int iRecordNum, long long* pIds,
                                const CStopwatch& watch);
    QV_INTERNAL bool HasUnbuiltContacts(int iTotalNum);
    QV_INTERNAL bool RefreshOnlineStatus();

    CMemManger* m_pclMemManger;
    CDBOperator* m_pDBOperator;
};

#endif
