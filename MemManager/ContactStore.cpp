#include "Common/DataPaths.h"
#include "Common/Log.h"
#include "MemManager/LockAttempts.h"
#include "MemManager/MemManger.h"
#include "MemManager/StoreCheck.h"

#include <atomic>
#include <cstring>
#include <new>
#include <sys/stat.h>

namespace
{

constexpr unsigned int READ_LOCK_PAUSE = 100; // milliseconds
constexpr int FLUSH_LATER = 0;
constexpr int FLUSH_NOW = 1;

bool TakeLockForBuild(CStoreLock* pLock)
{
    const bool bTaken = TryStoreLock(
        pLock,
        [](int iAttempt) {
            QV_LOGE(QV_LOG_TAG, "QV_Contacts:InitContactRecord write share memo lock false %d",
                    iAttempt);
        });
    if (!bTaken)
    {
        QV_LOGE(QV_LOG_TAG, "QV_Contacts:InitContactRecord write share memo lock false return");
    }
    return bTaken;
}

void WaitForLock(CStoreLock* pLock)
{
    while (!pLock->TryLock())
    {
        QV_LOGE(QV_LOG_TAG, "QV_Contacts: GetContactsResult Lock share mem false");
        Sleep(READ_LOCK_PAUSE);
    }
}

// Keeps the stores before it ahead of those after it, for whoever looks at the file after this
// process was killed in between and for readers without the lock.
void OrderStores()
{
    std::atomic_thread_fence(std::memory_order_seq_cst);
}

// Changes a mapped registration record; the capacity comes last, so that the record never looks
// finished before it is.
void WriteReg(tag_ContactReg* pReg, const tag_ContactReg& regNew)
{
    pReg->iMemSize = 0;
    OrderStores();
    pReg->iTotalNum = regNew.iTotalNum;
    pReg->iSortType = regNew.iSortType;
    OrderStores();
    pReg->iMemSize = regNew.iMemSize;
}

bool HasReg()
{
    struct stat info = {};
    return stat(CDataPaths::ContactReg(), &info) == 0 && S_ISREG(info.st_mode) &&
           info.st_size >= static_cast<off_t>(sizeof(tag_ContactReg));
}

// Sets the capacity of an existing registration record to 0, which asks for a rebuild until a
// complete change puts it back. 0, or -1 when the record cannot be marked.
int MarkUnfinished()
{
    if (!HasReg())
    {
        return 0;
    }
    CWriteMapping mapping(CDataPaths::ContactReg(), sizeof(tag_ContactReg));
    if (!mapping.IsOpen())
    {
        return -1;
    }
    mapping.As<tag_ContactReg>()->iMemSize = 0;
    OrderStores();
    return 0;
}

// Writes the records of a build. A good store is marked once its file is known to be large
// enough, so that a full disk changes nothing. A damaged one is marked before that: the larger
// file could make its record look good.
int WriteRecords(const tag_ContactsInfo& info, STORE_STATE eOldState)
{
    if (eOldState == STORE_DAMAGED && MarkUnfinished() != 0)
    {
        return -1;
    }
    CWriteMapping records(CDataPaths::ContactRecords(),
                          StoreBytes(info.RecordNum + STORE_SPARE_RECORDS));
    if (!records.IsOpen() || MarkUnfinished() != 0)
    {
        return -1;
    }
    std::memcpy(records.As<void>(), info.pContacts, StoreBytes(info.RecordNum));
    return 0;
}

// Writes the registration record of a build. Only a good record has a sort type to keep: of any
// other, GetSortType tells 0, which is the order that the build has written.
int WriteNewReg(int iTotalNum, STORE_STATE eOldState)
{
    CWriteMapping mapping(CDataPaths::ContactReg(), sizeof(tag_ContactReg));
    if (!mapping.IsOpen())
    {
        return -1;
    }
    auto* pReg = mapping.As<tag_ContactReg>();
    tag_ContactReg regNew = {};
    regNew.iTotalNum = iTotalNum;
    regNew.iSortType = eOldState == STORE_GOOD ? pReg->iSortType : STORE_ORDER_NAME;
    regNew.iMemSize = iTotalNum + STORE_SPARE_RECORDS;
    WriteReg(pReg, regNew);
    return 0;
}

} // namespace

CMemManger::CMemManger() = default;

CMemManger::~CMemManger()
{
    CloseWriteShareMem();
    UnlockMemo();
}

int CMemManger::InitContactRecord(tag_ContactsInfo* pInfo)
{
    if (pInfo == nullptr || pInfo->RecordNum < 0 ||
        pInfo->RecordNum > STORE_MAX_RECORDS - STORE_SPARE_RECORDS)
    {
        return -1;
    }
    CStoreLock lock;
    if (!TakeLockForBuild(&lock))
    {
        return -1;
    }
    tag_ContactReg regOld = {};
    const STORE_STATE eOldState = CStoreCheck::ReadReg(&regOld);
    if (pInfo->pContacts != nullptr && WriteRecords(*pInfo, eOldState) != 0)
    {
        return -1;
    }
    return WriteNewReg(pInfo->RecordNum, eOldState);
}

void CMemManger::GetContactsResult(tag_ContactsInfo** ppInfo)
{
    if (ppInfo == nullptr)
    {
        return;
    }
    auto* pInfo = new (std::nothrow) tag_ContactsInfo();
    *ppInfo = pInfo;
    if (pInfo == nullptr)
    {
        return;
    }
    CStoreLock lock;
    WaitForLock(&lock);
    tag_ContactReg reg = {};
    if (CStoreCheck::MapReg(&reg) != 0 || reg.iTotalNum <= 0)
    {
        return;
    }
    QV_LOGD(QV_LOG_TAG, "QV_Contacts:GetContactsResult iContactCount = %d\n", reg.iTotalNum);
    CReadMapping records(CDataPaths::ContactRecords(), StoreBytes(reg.iTotalNum));
    if (!records.IsOpen())
    {
        return;
    }
    pInfo->pContacts = new (std::nothrow) tag_ContactsStruct[static_cast<size_t>(reg.iTotalNum)];
    if (pInfo->pContacts == nullptr)
    {
        QV_LOGE(QV_LOG_TAG, "QV_Contacts: GetContactsResult NEW mem error");
        return;
    }
    pInfo->RecordNum = reg.iTotalNum;
    std::memcpy(pInfo->pContacts, records.As<void>(), StoreBytes(reg.iTotalNum));
}

int CMemManger::GetMemSize(int* piTotalNum)
{
    tag_ContactReg reg = {};
    if (CStoreCheck::MapReg(&reg) != 0)
    {
        return 0;
    }
    if (piTotalNum != nullptr)
    {
        *piTotalNum = reg.iTotalNum;
    }
    return reg.iMemSize;
}

int CMemManger::OpenWriteShareMem(tag_ContactsStruct** ppContacts, tag_ContactReg** ppReg)
{
    CloseWriteShareMem();
    if (ppContacts == nullptr || ppReg == nullptr)
    {
        return -1;
    }
    tag_ContactReg reg = {};
    if (CStoreCheck::ReadReg(&reg) == STORE_DAMAGED)
    {
        return -1;
    }
    CWriteMapping regMapping(CDataPaths::ContactReg(), sizeof(tag_ContactReg));
    if (!regMapping.IsOpen())
    {
        return -1;
    }
    const size_t uSize = StoreBytes(reg.iMemSize);
    CWriteMapping records;
    if (uSize > 0 && !records.Open(CDataPaths::ContactRecords(), uSize))
    {
        return -1;
    }
    m_iContactsMapSize = static_cast<int>(uSize);
    m_pContactReg = regMapping.Detach<tag_ContactReg>();
    m_pContacts = records.Detach<tag_ContactsStruct>();
    *ppContacts = m_pContacts;
    *ppReg = m_pContactReg;
    return 0;
}

void CMemManger::CloseWriteShareMem()
{
    CloseWriteShareMemory(m_pContactReg, sizeof(tag_ContactReg), FLUSH_LATER);
    CloseWriteShareMemory(m_pContacts, static_cast<size_t>(m_iContactsMapSize), FLUSH_LATER);
    m_pContactReg = nullptr;
    m_pContacts = nullptr;
}

int CMemManger::LockMemo()
{
    if (m_hMemLock != 0)
    {
        // Another attempt would be refused and would lose the handle that keeps the lock.
        return 0;
    }
    return CSingleMutex::Lock(&m_hMemLock);
}

int CMemManger::UnlockMemo()
{
    if (m_hMemLock == 0)
    {
        return 0;
    }
    const int iResult = CSingleMutex::UnLock(&m_hMemLock);
    if (iResult != 0)
    {
        m_hMemLock = 0;
    }
    return iResult;
}

int CMemManger::GetSortType()
{
    tag_ContactReg reg = {};
    return CStoreCheck::MapReg(&reg) == 0 ? reg.iSortType : STORE_ORDER_NAME;
}

void CMemManger::SetSortType(int iSortType)
{
    tag_ContactReg regOld = {};
    if (CStoreCheck::ReadReg(&regOld) != STORE_GOOD)
    {
        return;
    }
    CWriteMapping mapping(CDataPaths::ContactReg(), sizeof(tag_ContactReg));
    if (!mapping.IsOpen())
    {
        return;
    }
    auto* pReg = mapping.As<tag_ContactReg>();
    tag_ContactReg regNew = {};
    regNew.iTotalNum = pReg->iTotalNum;
    regNew.iSortType = iSortType;
    WriteReg(pReg, regNew);
    mapping.Close(FLUSH_NOW);
}

int CMemManger::UpdateContactRecord(tag_ContactsInfo* pInfo)
{
    (void)pInfo;
    return 0;
}
