#include "Common/DataPaths.h"
#include "Common/Log.h"
#include "MemManager/Files/MappingGuards.h"
#include "MemManager/Files/StoreLock.h"
#include "MemManager/MemManger.h"
#include "MemManager/StoreBuild.h"
#include "MemManager/StoreRegister.h"

#include <algorithm>
#include <cstring>
#include <new>

namespace
{

constexpr unsigned int READ_LOCK_PAUSE = 100; // milliseconds
constexpr int FLUSH_LATER = 0;

} // namespace

CMemManger::CMemManger() = default;

CMemManger::~CMemManger()
{
    CloseWriteShareMem();
    UnlockMemo();
}

int CMemManger::InitContactRecord(tag_ContactsInfo* pInfo)
{
    if (pInfo == nullptr)
    {
        return -1;
    }
    return CStoreBuild::Write(*pInfo, nullptr) == BUILD_FAILED ? -1 : 0;
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
    if (!WaitForStoreLock([&lock] { return lock.TryLock(); }, READ_LOCK_PAUSE,
                          "QV_Contacts: GetContactsResult Lock share mem false"))
    {
        return;
    }
    tag_ContactReg reg = {};
    CStoreRegister::Read(&reg);
    if (reg.iTotalNum == 0)
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
    if (!CStoreRegister::HasRecord(CStoreRegister::Read(&reg)))
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
    tag_ContactReg regFile = {};
    const STORE_STATE eState = CStoreRegister::Inspect(&regFile);
    if (eState == STORE_DAMAGED || eState == STORE_UNREADABLE)
    {
        return -1;
    }
    CWriteMapping reg(CDataPaths::ContactReg(), sizeof(tag_ContactReg));
    if (!reg.IsOpen())
    {
        return -1;
    }
    // The mapped capacity may be 0 by now, if a sort type was set; it cannot have grown.
    const int iCapacity = std::min(reg.As<tag_ContactReg>()->iMemSize, regFile.iMemSize);
    const size_t uSize = iCapacity > 0 ? StoreBytes(iCapacity) : 0;
    CWriteMapping records;
    if (uSize > 0 && !records.Open(CDataPaths::ContactRecords(), uSize))
    {
        return -1;
    }
    m_iContactsMapSize = static_cast<int>(uSize);
    m_pContactReg = reg.Detach<tag_ContactReg>();
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

LOCK_RESULT CMemManger::TryLockMemo()
{
    // Another attempt while the lock is held would be refused and would overwrite the handle that
    // holds it. A handle whose descriptor somebody else has closed is dropped.
    return CSingleMutex::IsHeld(m_hMemLock) ? LOCK_REFUSED : CSingleMutex::TryLock(&m_hMemLock);
}

int CMemManger::LockMemo()
{
    return CSingleMutex::IsHeld(m_hMemLock) ? 0 : CSingleMutex::Lock(&m_hMemLock);
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
    CStoreRegister::Read(&reg);
    return reg.iSortType;
}

void CMemManger::SetSortType(int iSortType)
{
    CStoreRegister::StoreSortType(iSortType);
}

int CMemManger::UpdateContactRecord(tag_ContactsInfo* pInfo)
{
    (void)pInfo;
    return 0;
}
