#include "Common/DataPaths.h"
#include "Common/Log.h"
#include "Filter/FilterChainBuilder.h"
#include "Filter/RecordTest.h"
#include "MemManager/CandidateEntries.h"
#include "MemManager/LockAttempts.h"
#include "MemManager/MemManger.h"
#include "MemManager/SpecialNumbers.h"
#include "MemManager/StoreCheck.h"

#include <cstring>
#include <memory>
#include <new>

namespace
{

// Counters of GetFirstWordInfo; the last one of each order counts all other entries.
constexpr int FIRST_TIME_SECTION = '1';
constexpr int TIME_SECTIONS = 5;
constexpr int FIRST_NAME_SECTION = 'A';
constexpr int NAME_SECTIONS = 26;

bool TakeLockForSearch(CStoreLock* pLock)
{
    const bool bTaken = TryStoreLock(
        pLock,
        [](int iAttempt)
        {
            QV_LOGE(QV_LOG_TAG, "QV_Contacts: CopyContactsResult write share memo lock false %d",
                    iAttempt);
        });
    if (!bTaken)
    {
        QV_LOGE(QV_LOG_TAG, "QV_Contacts:CopyContactsResult write share memo lock false return");
    }
    return bTaken;
}

// Maps all stored records and returns their number; 0 when there are none to be read.
int OpenStoredRecords(CReadMapping* pRecords)
{
    tag_ContactReg reg = {};
    if (CStoreCheck::MapReg(&reg) != 0 || reg.iTotalNum <= 0)
    {
        return 0;
    }
    QV_LOGD(QV_LOG_TAG, "QV_Contacts:CopyContactsResult iContactCount = %d\n", reg.iTotalNum);
    return pRecords->Open(CDataPaths::ContactRecords(), StoreBytes(reg.iTotalNum)) ? reg.iTotalNum
                                                                                   : 0;
}

template <typename T>
std::unique_ptr<T[]> NewUnderLock(int iCount)
{
    std::unique_ptr<T[]> pArray(new (std::nothrow) T[static_cast<size_t>(iCount)]);
    if (pArray == nullptr)
    {
        QV_LOGE(QV_LOG_TAG, "QV_Contacts: CopyContactsResult NEW mem error");
    }
    return pArray;
}

// The store as a search holds it while it reads: the lock, the mapping, the number of records.
struct tag_OpenStore
{
    CStoreLock lock;
    CReadMapping records;
    int iCount = 0;

    void Close()
    {
        records.Close();
        lock.Release();
    }
};

// Makes the entries from the records where they lie. That holds the lock no longer than copying
// the records would, since entries are an eighth of them.
void SelectFromStore(tag_OpenStore* pStore, const CFilterChain& chain, tag_LocalizerResult* pResult)
{
    auto pEntries = NewUnderLock<tag_LocalizerDetail>(pStore->iCount);
    if (pEntries == nullptr)
    {
        return;
    }
    const int iKept = CCandidateEntries::Select(pStore->records.As<tag_ContactsStruct>(),
                                                pStore->iCount, chain, pEntries.get());
    pStore->Close();
    CCandidateEntries::LogFilterResult(iKept);
    if (iKept > 0)
    {
        pResult->iResultNum = iKept;
        pResult->pDetail = pEntries.release();
    }
}

// Copies the records out, gives the store back and filters the copy.
void CopyFromStore(tag_OpenStore* pStore, CFilterChain& chain, tag_LocalizerResult* pResult)
{
    const auto pCopy = NewUnderLock<tag_ContactsStruct>(pStore->iCount);
    if (pCopy == nullptr)
    {
        return;
    }
    std::memcpy(pCopy.get(), pStore->records.As<void>(), StoreBytes(pStore->iCount));
    pStore->Close();
    tag_ContactsInfo copy = {pStore->iCount, pCopy.get()};
    CCandidateEntries::NarrowCopy(&copy, chain, pResult);
}

// A set of iNum entries that are not filled yet; null for want of memory. *pbArrayFailed tells
// which allocation it was.
tag_LocalizerResult* NewSet(int iNum, bool* pbArrayFailed)
{
    *pbArrayFailed = false;
    std::unique_ptr<tag_LocalizerResult> pSet(new (std::nothrow) tag_LocalizerResult());
    if (pSet == nullptr || iNum <= 0)
    {
        return pSet.release();
    }
    pSet->pDetail = new (std::nothrow) tag_LocalizerDetail[static_cast<size_t>(iNum)];
    if (pSet->pDetail == nullptr)
    {
        *pbArrayFailed = true;
        return nullptr;
    }
    pSet->iResultNum = iNum;
    return pSet.release();
}

size_t EntryBytes(int iNum)
{
    return static_cast<size_t>(iNum) * sizeof(tag_LocalizerDetail);
}

// Counts each entry in the counter of its section, iSections of them from iFirst on, or in the
// one behind them.
void CountSections(const tag_LocalizerResult& set, int iFirst, int iSections, int* piCounts)
{
    for (int i = 0; i < set.iResultNum; ++i)
    {
        const int iWord = set.pDetail[i].iFirstWord;
        const bool bInside = iWord >= iFirst && iWord < iFirst + iSections;
        ++piCounts[bInside ? iWord - iFirst : iSections];
    }
}

} // namespace

void CMemManger::CopyContactsResult(CFilterChain& chain, tag_LocalizerResult** ppResult)
{
    if (ppResult == nullptr)
    {
        return;
    }
    *ppResult = new (std::nothrow) tag_LocalizerResult();
    if (*ppResult == nullptr)
    {
        QV_LOGE(QV_LOG_TAG, "QV_Contacts:CopyContactsResult new LocalizerResult error");
        return;
    }
    tag_OpenStore store;
    if (!TakeLockForSearch(&store.lock))
    {
        return;
    }
    store.iCount = OpenStoredRecords(&store.records);
    if (store.iCount == 0)
    {
        return;
    }
    if (CRecordTest::CanTest(chain))
    {
        SelectFromStore(&store, chain, *ppResult);
    }
    else
    {
        CopyFromStore(&store, chain, *ppResult);
    }
}

void CMemManger::CopySpecialNumberRecord(tag_LocalizerResult** ppResult)
{
    if (ppResult == nullptr)
    {
        return;
    }
    auto* pSet = new (std::nothrow) tag_LocalizerResult();
    *ppResult = pSet;
    if (pSet == nullptr)
    {
        return;
    }
    pSet->pDetail = new (std::nothrow) tag_LocalizerDetail[SPECIAL_NUMBER_COUNT];
    if (pSet->pDetail != nullptr)
    {
        pSet->iResultNum = SPECIAL_NUMBER_COUNT;
        std::memcpy(pSet->pDetail, g_specialNumberRecords, sizeof(g_specialNumberRecords));
    }
}

int CMemManger::NewSearchResult(tag_LocalizerResult* pSrc, tag_LocalizerResult** ppNew)
{
    if (pSrc == nullptr || ppNew == nullptr)
    {
        return -1;
    }
    bool bArrayFailed = false;
    *ppNew = NewSet(pSrc->iResultNum, &bArrayFailed);
    if (*ppNew == nullptr)
    {
        return -1;
    }
    if ((*ppNew)->pDetail != nullptr)
    {
        std::memset((*ppNew)->pDetail, 0, EntryBytes(pSrc->iResultNum));
    }
    return 0;
}

int CMemManger::CopySearchResult(tag_LocalizerResult* pSrc, tag_LocalizerResult** ppOut)
{
    if (pSrc == nullptr || ppOut == nullptr)
    {
        return -1;
    }
    bool bArrayFailed = false;
    *ppOut = NewSet(pSrc->iResultNum, &bArrayFailed);
    if (bArrayFailed)
    {
        QV_LOGE(QV_LOG_TAG, "QV_Contacts: CopySearchResult malloc mem error");
    }
    if (*ppOut == nullptr)
    {
        return -1;
    }
    if ((*ppOut)->pDetail != nullptr)
    {
        std::memcpy((*ppOut)->pDetail, pSrc->pDetail, EntryBytes(pSrc->iResultNum));
    }
    return 0;
}

int CMemManger::GetSearchRecord(tag_LocalizerResult* pSrc, int iStart, int iCount,
                                tag_LocalizerResult* pPage)
{
    if (pSrc == nullptr || pPage == nullptr || iStart < 0 || iCount < 0)
    {
        return -1;
    }
    if (iStart >= pSrc->iResultNum || iCount > pSrc->iResultNum - iStart)
    {
        return -1;
    }
    pPage->iResultNum = iCount;
    pPage->pDetail = pSrc->pDetail + iStart;
    return 0;
}

int CMemManger::GetIndexByContactsId(tag_LocalizerResult* pSrc, long iContactID)
{
    if (pSrc == nullptr)
    {
        return -1;
    }
    for (int i = 0; i < pSrc->iResultNum; ++i)
    {
        if (pSrc->pDetail[i].iContactID == iContactID)
        {
            return i;
        }
    }
    return 0;
}

int CMemManger::GetFirstWordInfo(tag_LocalizerResult* pSrc, int* piCounts)
{
    if (pSrc == nullptr || piCounts == nullptr)
    {
        return -1;
    }
    if (GetSortType() == STORE_ORDER_TIME)
    {
        CountSections(*pSrc, FIRST_TIME_SECTION, TIME_SECTIONS, piCounts);
    }
    else
    {
        CountSections(*pSrc, FIRST_NAME_SECTION, NAME_SECTIONS, piCounts);
    }
    return 0;
}

int CMemManger::FreeSearchResult(tag_LocalizerResult* pSrc)
{
    if (pSrc == nullptr)
    {
        return -1;
    }
    delete[] pSrc->pDetail;
    delete pSrc;
    return 0;
}

int CMemManger::CreateFilterChain(int* piType, QVLong32* plID, int iNum, CFilterChain** ppChain)
{
    return BuildFilterChain(piType, plID, iNum, ppChain);
}
