#include "MemManager/ContactSelection.h"

#include "Common/DataPaths.h"
#include "Common/Log.h"
#include "Filter/FilterChain.h"
#include "Filter/FilterProcess.h"
#include "Filter/FilterProcessFactory.h"
#include "Filter/RecordRule.h"
#include "MemManager/Files/MappingGuards.h"
#include "MemManager/Files/StoreLock.h"
#include "MemManager/StoreRegister.h"

#include <algorithm>
#include <cstring>
#include <memory>
#include <new>

namespace
{

// An entry's field of this text is one unit shorter than the record's.
constexpr int ENTRY_MAX_RESERVED = 4;
static_assert(sizeof(tag_LocalizerDetail::szReserved) / sizeof(wchar_t) == ENTRY_MAX_RESERVED + 1,
              "room for a terminator");

// Copies up to the terminator, at most iMax units: a damaged record may have none. The target is
// zero-filled.
void CopyText(wchar_t* szTarget, const wchar_t* szSource, int iMax)
{
    for (int i = 0; i < iMax && szSource[i] != 0; ++i)
    {
        szTarget[i] = szSource[i];
    }
}

void FillEntry(const tag_ContactsStruct& record, tag_LocalizerDetail* pEntry)
{
    *pEntry = {};
    pEntry->iContactID = record.iContactID;
    pEntry->iSortIndex = record.iSortIndex;
    CopyText(pEntry->szLocalizerKey, record.szLocalizerKey, CONTACT_MAX_KEY);
    CopyText(pEntry->szReserved, record.szReserved, ENTRY_MAX_RESERVED);
    pEntry->llLastTimeContacted = record.llLastTimeContacted;
}

bool IsEmptySlot(const tag_ContactsStruct& record)
{
    return record.iContactID == 0;
}

// The fields that are read lie too far apart for the hardware prefetcher to see a pattern.
constexpr int PREFETCH_AHEAD = 24;

// Prefetches what decides whether a record becomes an entry. What only an entry needs would cost
// as much memory traffic again for the many records that do not become one.
void Prefetch(const tag_ContactsStruct& record, bool bFiltered)
{
    __builtin_prefetch(&record.szLocalizerKey[0]);
    __builtin_prefetch(&record.szLocalizerKey[1]);
    if (bFiltered)
    {
        __builtin_prefetch(&record.iContactID);
        __builtin_prefetch(&record.iFlags);
    }
}

} // namespace

CCandidateEntries::Counts CCandidateEntries::Select(const tag_ContactsStruct* pRecords, int iCount,
                                                    bool bEmptySlots, CFilterChain& chain,
                                                    CCandidateFilter* pTest,
                                                    tag_LocalizerDetail* pEntries)
{
    const CRecordRule test(chain);
    const bool bFiltered = chain.GetFilterNum() != 0;
    Counts counts = {0, 0};
    for (int i = 0; i < iCount; ++i)
    {
        Prefetch(pRecords[std::min(i + PREFETCH_AHEAD, iCount - 1)], bFiltered);
        if ((bEmptySlots && IsEmptySlot(pRecords[i])) || (bFiltered && !test.Keeps(pRecords[i])))
        {
            continue;
        }
        ++counts.iKept;
        if (pTest == nullptr || pTest->MayMatch(pRecords[i].szLocalizerKey))
        {
            FillEntry(pRecords[i], &pEntries[counts.iWritten++]);
        }
    }
    return counts;
}

void CCandidateEntries::DropEmptySlots(tag_ContactsInfo* pCopy)
{
    tag_ContactsStruct* pEnd =
        std::remove_if(pCopy->pContacts, pCopy->pContacts + pCopy->RecordNum, IsEmptySlot);
    pCopy->RecordNum = static_cast<int32_t>(pEnd - pCopy->pContacts);
}

void CCandidateEntries::NarrowCopy(tag_ContactsInfo* pCopy, CFilterChain& chain,
                                   tag_LocalizerResult* pResult)
{
    const std::unique_ptr<FilterProcess> pPipeline(FilterProcessFactory::CreateFilterProcess());
    if (pPipeline == nullptr || pPipeline->FilterRecord(pCopy, chain) != 0)
    {
        return;
    }
    const int iNum = pCopy->RecordNum;
    LogFilterResult(iNum);
    if (iNum == 0)
    {
        return;
    }
    pResult->pDetail = new (std::nothrow) tag_LocalizerDetail[static_cast<size_t>(iNum)];
    if (pResult->pDetail == nullptr)
    {
        return;
    }
    pResult->iResultNum = iNum;
    for (int i = 0; i < iNum; ++i)
    {
        FillEntry(pCopy->pContacts[i], &pResult->pDetail[i]);
    }
}

void CCandidateEntries::LogFilterResult(int iNum)
{
    QV_LOGD(QV_LOG_TAG, "QV_Contacts: CopyContactsResult Filter Result Num = %d\n", iNum);
}

namespace
{

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

// The store while a search reads it: the lock, the mapping, the number of records.
struct tag_OpenStore
{
    CStoreLock lock;
    CReadMapping records;
    int iCount = 0;
    bool bMarked = false; // then slots of contact id 0 are skipped

    // Maps all stored records; false when there are none or they cannot be mapped.
    bool Open()
    {
        tag_ContactReg reg = {};
        bMarked = CStoreRegister::Read(&reg) == STORE_MARKED;
        iCount = reg.iTotalNum;
        if (iCount == 0)
        {
            return false;
        }
        QV_LOGD(QV_LOG_TAG, "QV_Contacts:CopyContactsResult iContactCount = %d\n", iCount);
        return records.Open(CDataPaths::ContactRecords(), StoreBytes(iCount));
    }
    void Close()
    {
        records.Close();
        lock.Release();
    }
};

// Makes the entries straight from the mapping. That holds the lock no longer than copying the
// records would: of each record a few cache lines are read, and an entry is an eighth of its size.
// The array has room for all records, but its unused part is never touched.
// Returns whether the array is dense: at least half of it is used.
bool SelectFromStore(tag_OpenStore* pStore, CFilterChain& chain, CCandidateFilter* pTest,
                     tag_LocalizerResult* pResult)
{
    auto pEntries = NewUnderLock<tag_LocalizerDetail>(pStore->iCount);
    if (pEntries == nullptr)
    {
        return true;
    }
    const CCandidateEntries::Counts counts =
        CCandidateEntries::Select(pStore->records.As<tag_ContactsStruct>(), pStore->iCount,
                                  pStore->bMarked, chain, pTest, pEntries.get());
    pStore->Close();
    CCandidateEntries::LogFilterResult(counts.iKept);
    if (counts.iWritten > 0)
    {
        pResult->iResultNum = counts.iWritten;
        pResult->pDetail = pEntries.release();
    }
    return counts.iWritten == 0 || counts.iWritten >= pStore->iCount - counts.iWritten;
}

// Copies the records, releases the store and filters the copy.
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
    if (pStore->bMarked)
    {
        CCandidateEntries::DropEmptySlots(&copy);
    }
    CCandidateEntries::NarrowCopy(&copy, chain, pResult);
}

} // namespace

void CContactSelection::Copy(CFilterChain& chain, CCandidateFilter* pTest,
                             tag_LocalizerResult** ppResult, bool* pbDense)
{
    *pbDense = true;
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
    if (!store.Open())
    {
        return;
    }
    if (CRecordRule::CanTest(chain))
    {
        *pbDense = SelectFromStore(&store, chain, pTest, *ppResult);
    }
    else
    {
        CopyFromStore(&store, chain, *ppResult);
    }
}
