#include "MemManager/ContactSelection.h"

#include "Common/DataPaths.h"
#include "Common/Log.h"
#include "Filter/RecordTest.h"
#include "MemManager/CandidateEntries.h"
#include "MemManager/LockAttempts.h"
#include "MemManager/StoreRegister.h"

#include <cstring>
#include <memory>
#include <new>

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

// The store as a search holds it while it reads: the lock, the mapping, the number of records.
struct tag_OpenStore
{
    CStoreLock lock;
    CReadMapping records;
    int iCount = 0;
    bool bMarked = false; // slots without a contact are no contacts of id 0

    // Maps all stored records; false when there are none to be read.
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

// Makes the entries from the records where they lie. That holds the lock no longer than copying
// the records would: of each a few cache lines are read, and entries are an eighth of them.
// Room for all is taken, but most of it is never touched.
// Returns whether the array is dense: what is spare is no more than what is used.
bool SelectFromStore(tag_OpenStore* pStore, CFilterChain& chain, CCandidateTest* pTest,
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
    if (pStore->bMarked)
    {
        CCandidateEntries::DropEmptySlots(&copy);
    }
    CCandidateEntries::NarrowCopy(&copy, chain, pResult);
}

} // namespace

void CContactSelection::Copy(CFilterChain& chain, CCandidateTest* pTest,
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
    if (CRecordTest::CanTest(chain))
    {
        *pbDense = SelectFromStore(&store, chain, pTest, *ppResult);
    }
    else
    {
        CopyFromStore(&store, chain, *ppResult);
    }
}
