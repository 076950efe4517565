#ifndef QV_CORE_LOCALIZERLOGIC_H
#define QV_CORE_LOCALIZERLOGIC_H

#include "Common/Export.h"
#include "Core/ContactRecords.h"
#include "Core/SearchRecords.h"

class CDBOperator;
class CFilterChain;
class CMemManger;

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
// Results: 0, or -1 for a null argument, a refused lock, a file that cannot be mapped, a database
// that cannot be read or a lack of memory; LOC_ERR_MAP and LOC_ERR_PARAM of
// Core/LocalizerCodes.h from the pinyin operations and the search itself.
class QV_EXPORT CLocalizerLogic
{
public:
    // Opens no file and reads nothing. When its parts find no memory, MemInit and Search return
    // -1 and nothing else may be called.
    CLocalizerLogic();
    ~CLocalizerLogic();
    CLocalizerLogic(const CLocalizerLogic&) = delete;
    CLocalizerLogic& operator=(const CLocalizerLogic&) = delete;

    // Builds the whole index from the provider's database, unless bForce is false and an index is
    // there. The database is read without the store lock; the lock is held while the files are
    // written, after at most five attempts 200 ms apart. The stored sort type is kept. The online
    // state may fail to be read: that is logged and ignored. LOC_ERR_MAP without a pinyin table.
    // After a failure the old index stays.
    int MemInit(bool bForce);

    // One search, within pLastResult (read only, stays the caller's) or, when it is null, within
    // all contacts that pass pFilterChain, or for IME_SEARCH_SPECIAL within the special numbers.
    // pFilterChain is never null, also where it is not used.
    //   szInput    at most 10 characters; its letters become lowercase and its Chinese characters
    //              their codes, in place
    //   ppResult   gets a set of its own, released with FreeSearchResult: the matches, best
    //              first; null when only its memory could not be had; untouched after any earlier
    //              failure
    //   pMask      gets the keys that can follow: bits 0..25 letters, 0x4000000 anything else
    //   szWordOut  at least 20 wide characters, zeroed: gets the Chinese characters that the last
    //              letters may stand for, without terminator
    // iReserved is not used. A store lock refused five times in a second, or no index: an empty
    // set. A search type outside 0..2: 0, with nothing written.
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

private:
    int BuildIndex(tag_ContactsInfo& record);
    int ReadContacts(tag_ContactsInfo& record);
    void ReadOnlineStatus(tag_ContactsInfo& record);
    static int SortByStoredOrder(tag_ContactsInfo& record, int iSortType);
    void CopySource(IME_SEARCH_TYPE eSearchType, CFilterChain& chain,
                    tag_LocalizerResult** ppSource);

    CMemManger* m_pclMemManger;
    CDBOperator* m_pDBOperator;
};

#endif
