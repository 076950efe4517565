#include "Core/LocalizerLogic.h"

#include "Common/DataPaths.h"
#include "Common/Log.h"
#include "Common/Stopwatch.h"
#include "DBOperator/DBOperator.h"
#include "DBOperator/DBOperatorFactory.h"
#include "LocalizerImpl/QVLocalizerManager.h"
#include "LocalizerImpl/QVNumLocalizerManager.h"
#include "LocalizerImpl/QVWordLocalizerManager.h"
#include "LocalizerImpl/SearchRun.h"
#include "MemManager/ContactSelection.h"
#include "MemManager/HeldStore.h"
#include "MemManager/MemManger.h"
#include "MemManager/ResultSet.h"
#include "MemManager/StoreBuild.h"
#include "MemManager/StoreRegister.h"

#include <memory>
#include <new>
#include <sys/stat.h>
#include <unistd.h>

namespace
{

constexpr int MATCH_ANYWHERE = 1;
constexpr int MAX_RESORTS = 3;

// Size of a file, 0 when it is missing or empty.
int FileSize(const char* szPath)
{
    struct stat info = {};
    if (access(szPath, F_OK) != 0 || stat(szPath, &info) != 0)
    {
        return 0;
    }
    return static_cast<int>(info.st_size);
}

// The matcher for a kind of input; null if the allocation fails.
std::unique_ptr<CQVLocalizerManager> CreateMatcher(IME_SEARCH_TYPE eSearchType)
{
    using Owner = std::unique_ptr<CQVLocalizerManager>;
    return eSearchType == IME_SEARCH_NUM
               ? Owner(new (std::nothrow) CQVNumLocalizerManager(MATCH_ANYWHERE))
               : Owner(new (std::nothrow) CQVWordLocalizerManager(MATCH_ANYWHERE));
}

bool IsKnownType(IME_SEARCH_TYPE eSearchType)
{
    return eSearchType == IME_SEARCH_WORD || eSearchType == IME_SEARCH_NUM ||
           eSearchType == IME_SEARCH_SPECIAL;
}

// The caller's result with room for iNum entries; null if an allocation fails.
tag_LocalizerResult* NewResult(int iNum)
{
    bool bNoEntries = false;
    tag_LocalizerResult* pResult = NewSet(iNum, &bNoEntries);
    if (bNoEntries)
    {
        QV_LOGE(QV_LOG_TAG, "QV_Contacts: CopySearchResult malloc mem error");
    }
    return pResult;
}

// Finishes a search into the caller's result: the facade's own candidate set if all of it matches
// and its array is dense, else a new set. 0, or -1 if the allocation fails or ppResult is null;
// the keys that can follow are written all the same.
int HandOut(CSearchRun& run, CResultOwner& copy, const tag_LocalizerResult& source, int iFound,
            tag_LocalizerResult** ppResult, long* pMask, wchar_t* szWordOut)
{
    if (ppResult != nullptr && copy.IsDense() && iFound == source.iResultNum)
    {
        *ppResult = copy.Detach();
        run.FinishInPlace(**ppResult, pMask, szWordOut);
        return 0;
    }
    tag_LocalizerResult* pResult = ppResult != nullptr ? NewResult(iFound) : nullptr;
    run.Finish(source, pResult, pMask, szWordOut);
    if (ppResult != nullptr)
    {
        *ppResult = pResult;
    }
    return pResult != nullptr ? 0 : -1;
}

} // namespace

int IsNeedReload()
{
    const int iMappingSize = FileSize(CDataPaths::PinyinMapping());
    if (iMappingSize == 0)
    {
        return 1;
    }
    QV_LOGD(QV_LOG_TAG, "QV_Contacts: IsNeedReload 2 size = %d\n", iMappingSize);
    const int iRegSize = FileSize(CDataPaths::ContactReg());
    if (iRegSize == 0)
    {
        return 1;
    }
    QV_LOGD(QV_LOG_TAG, "QV_Contacts: IsNeedReload 4 size = %d\n", iRegSize);
    return 0;
}

CLocalizerLogic::CLocalizerLogic()
    : m_pclMemManger(nullptr),
      m_pDBOperator(CDBOperatorFactory::CreateDBOperator(DB_OPERATOR_SQLITE))
{
    m_pclMemManger = new (std::nothrow) CMemManger;
}

CLocalizerLogic::~CLocalizerLogic()
{
    delete m_pclMemManger;
    m_pclMemManger = nullptr;
    delete m_pDBOperator;
    m_pDBOperator = nullptr;
}

int CLocalizerLogic::MemInit(bool bForce)
{
    if (!bForce && IsNeedReload() == 0 && IsStoreWhole())
    {
        return 0;
    }
    if (m_pDBOperator == nullptr || m_pclMemManger == nullptr)
    {
        return -1;
    }
    const CStopwatch watch;
    const int iRet = CQVLocalizerManager::InitMapFile();
    if (iRet != 0)
    {
        return iRet;
    }
    QV_LOGD(QV_LOG_TAG, "QV_Contacts: MemInit IFL_InitalMap time = %d\n", watch.Elapsed());

    tag_ContactsInfo record = {};
    const int iBuilt = BuildIndex(record);
    delete[] record.pContacts;
    return iBuilt;
}

// Reads, converts, sorts and writes the contacts; what it leaves in record the caller releases.
int CLocalizerLogic::BuildIndex(tag_ContactsInfo& record)
{
    int iRet = ReadContacts(record);
    if (iRet != 0)
    {
        return iRet;
    }
    const CStopwatch sortWatch;
    int iSortType = STORE_ORDER_NAME;
    if (record.pContacts != nullptr)
    {
        iRet = ReadStoredOrder(iSortType);
        iRet = iRet == 0 ? ConvertAndSort(record, iSortType) : iRet;
        if (iRet != 0)
        {
            return iRet;
        }
    }
    QV_LOGD(QV_LOG_TAG, "QV_Contacts: MemInit IFL_PtrQuickSort time = %d\n", sortWatch.Elapsed());

    const CStopwatch writeWatch;
    iRet = WriteSorted(record, iSortType);
    if (iRet == 0)
    {
        QV_LOGD(QV_LOG_TAG, "QV_Contacts: MemInit InitContactRecord time = %d\n",
                writeWatch.Elapsed());
    }
    return iRet;
}

int CLocalizerLogic::ReadContacts(tag_ContactsInfo& record)
{
    const CStopwatch watch;
    const int iRet = m_pDBOperator->ReadAllLocalizer(&record, 0, nullptr);
    if (iRet != 0)
    {
        return iRet;
    }
    ReadOnlineStatus(record);
    QV_LOGD(QV_LOG_TAG, "QV_Contacts: MemInit ReadAllLocalizer time = %d\n", watch.Elapsed());
    return 0;
}

// An index without online states is still useful, so a failure is only logged.
void CLocalizerLogic::ReadOnlineStatus(tag_ContactsInfo& record)
{
    const int iRet = m_pDBOperator->ReadAllSmsOnlineStatus(&record, 0, nullptr);
    if (iRet != 0)
    {
        QV_LOGD(QV_LOG_TAG, "QV_Contacts: ReadAllSmsOnlineStatus  error = %d\n", iRet);
    }
}

// The stored sort type, STORE_ORDER_NAME where there is none. 0, or -1 when it cannot be read: a
// build must not take a failed read for name order.
int CLocalizerLogic::ReadStoredOrder(int& iSortType)
{
    tag_ContactReg reg = {};
    const STORE_STATE eState = CStoreRegister::Read(&reg);
    iSortType = reg.iSortType;
    return eState == STORE_UNREADABLE ? -1 : 0;
}

// Names become pinyin keys, then the records are sorted.
int CLocalizerLogic::ConvertAndSort(tag_ContactsInfo& record, int iSortType)
{
    const int iRet = CQVLocalizerManager::TransNameToPY(record.pContacts, record.RecordNum);
    return iRet == 0 ? SortConverted(record, iSortType) : iRet;
}

// Sorts by name, which numbers the records, then by any other order.
int CLocalizerLogic::SortConverted(tag_ContactsInfo& record, int iSortType)
{
    const int iRet = CQVLocalizerManager::LocalizerQuickSort(record.pContacts, record.RecordNum,
                                                             STORE_ORDER_NAME);
    if (iRet != 0 || iSortType == STORE_ORDER_NAME)
    {
        return iRet;
    }
    return CQVLocalizerManager::LocalizerQuickSort(record.pContacts, record.RecordNum, iSortType);
}

// Writes the records, sorted by iSortType, and sorts them anew if the sort type was set meanwhile.
// If that happens again and again, the store stays marked.
int CLocalizerLogic::WriteSorted(tag_ContactsInfo& record, int iSortType)
{
    BUILD_RESULT eResult = CStoreBuild::Write(record, &iSortType);
    for (int i = 0; i < MAX_RESORTS && eResult == BUILD_OUT_OF_ORDER; ++i)
    {
        if (ReadStoredOrder(iSortType) != 0 || SortConverted(record, iSortType) != 0)
        {
            return -1;
        }
        eResult = CStoreBuild::Write(record, &iSortType);
    }
    if (eResult == BUILD_FAILED)
    {
        return -1;
    }
    CStoreRegister::SetChangeLost(false);
    return 0;
}

int CLocalizerLogic::Search(tag_LocalizerResult* pLastResult, wchar_t* szInput,
                            IME_SEARCH_TYPE eSearchType, CFilterChain* pFilterChain,
                            int /*iReserved*/, tag_LocalizerResult** ppResult, long* pMask,
                            wchar_t* szWordOut)
{
    if (pFilterChain == nullptr || m_pclMemManger == nullptr)
    {
        return -1;
    }
    QV_LOGD(QV_LOG_TAG, "QV_Contacts: Search Start\n");
    const std::unique_ptr<CQVLocalizerManager> matcher = CreateMatcher(eSearchType);
    if (matcher == nullptr)
    {
        return -1;
    }
    // The text is prepared before the store is read, so that only what can match gets an entry.
    CSearchRun run(*matcher);
    const bool bKnown = IsKnownType(eSearchType);
    const bool bComplete = szInput != nullptr && pMask != nullptr && szWordOut != nullptr;
    const int iBegun = bKnown && bComplete ? run.Begin(szInput) : LOC_ERR_PARAM;
    if (iBegun != 0)
    {
        return bKnown ? iBegun : 0; // a search that finds nothing does not wait for the lock
    }
    CResultOwner copy(*m_pclMemManger);
    tag_LocalizerResult* pSource = pLastResult;
    int bTimeOrder = 0;
    if (pLastResult == nullptr)
    {
        CopySource(eSearchType, *pFilterChain, run, copy);
        pSource = copy.Get();
        bTimeOrder = m_pclMemManger->GetSortType() == STORE_ORDER_TIME ? 1 : 0;
    }
    if (pSource == nullptr)
    {
        return -1;
    }
    const CStopwatch watch;
    int iRet = run.Find(*pSource, bTimeOrder);
    if (iRet >= 0)
    {
        iRet = HandOut(run, copy, *pSource, iRet, ppResult, pMask, szWordOut);
    }
    QV_LOGD(QV_LOG_TAG, "QV_Contacts: Search IFL_Search time = %d\n", watch.Elapsed());
    return iRet;
}

// The candidate set of a whole-store search, without the contacts that cannot match; empty or null
// after a failure.
void CLocalizerLogic::CopySource(IME_SEARCH_TYPE eSearchType, CFilterChain& chain,
                                 CCandidateFilter& test, CResultOwner& copy)
{
    const CStopwatch watch;
    if (eSearchType == IME_SEARCH_SPECIAL)
    {
        m_pclMemManger->CopySpecialNumberRecord(copy.Receive());
        copy.SetDense(true);
    }
    else
    {
        bool bDense = false;
        CContactSelection::Copy(chain, &test, copy.Receive(), &bDense);
        copy.SetDense(bDense);
    }
    QV_LOGD(QV_LOG_TAG, "QV_Contacts: Search CopyContactsResult time = %d\n", watch.Elapsed());
}

int CLocalizerLogic::GetLocalizer(wchar_t* szDisplayName, wchar_t* szOut)
{
    return CQVLocalizerManager::GetLocalizerChars(szDisplayName, szOut);
}

int CLocalizerLogic::GetLocalizerBatch(tag_ContactsInfo* pInfo)
{
    return CQVLocalizerManager::GetLocalizerBatch(pInfo);
}

int CLocalizerLogic::GetLocalizerString(wchar_t* szInput, int iPos, wchar_t* szWord, wchar_t* szOut)
{
    return CQVLocalizerManager::GetLocalizerString(szInput, iPos, szWord, szOut);
}

int CLocalizerLogic::GetLocalizerString(long hMap, wchar_t* szDisplayName, wchar_t* szOut)
{
    return CQVLocalizerManager::GetLocalizerString(hMap, szDisplayName, szOut);
}

long CLocalizerLogic::CreatePinYinFileMapping()
{
    return CQVLocalizerManager::CreatePinYinFileMapping();
}

int CLocalizerLogic::ReleasePinYinFileMapping(long hMap)
{
    return CQVLocalizerManager::ReleasePinYinFileMapping(hMap);
}

int CLocalizerLogic::GetSearchResult(tag_LocalizerResult* pResult, int iStart, int iCount,
                                     tag_LocalizerResult* pPage)
{
    return m_pclMemManger->GetSearchRecord(pResult, iStart, iCount, pPage);
}

int CLocalizerLogic::FreeSearchResult(tag_LocalizerResult* pResult)
{
    return m_pclMemManger->FreeSearchResult(pResult);
}

int CLocalizerLogic::GetFirstWordInfo(tag_LocalizerResult* pResult, int* piCounts)
{
    return m_pclMemManger->GetFirstWordInfo(pResult, piCounts);
}

int CLocalizerLogic::GetIndexByContactsId(tag_LocalizerResult* pResult, long iContactID)
{
    return m_pclMemManger->GetIndexByContactsId(pResult, iContactID);
}

int CLocalizerLogic::CreateFilterChain(int* piType, QVLong32* plID, int iNum,
                                       CFilterChain** ppChain)
{
    return m_pclMemManger->CreateFilterChain(piType, plID, iNum, ppChain);
}

void CLocalizerLogic::SetSortType(int iSortType)
{
    m_pclMemManger->SetSortType(iSortType);
}

int CLocalizerLogic::GetSortType()
{
    return m_pclMemManger->GetSortType();
}
