#include "MemManager/HeldStore.h"

#include "Common/DataPaths.h"
#include "Common/Log.h"
#include "MemManager/Files/StoreLock.h"
#include "MemManager/MemManger.h"

namespace
{

// Milliseconds between attempts at the lock.
constexpr unsigned int PATCH_LOCK_PAUSE = 100;
constexpr unsigned int RECORD_LOCK_PAUSE = 50;

// Under the lock, or without it when it cannot be had; false when the store could not be marked.
bool MarkOrRemember()
{
    const bool bMarked = CStoreRegister::MarkFile() == 0;
    if (!bMarked)
    {
        CStoreRegister::SetChangeLost(true);
    }
    return bMarked;
}

// Without the lock a running writer may lift the mark, so the process remembers as well.
void MarkWithoutLock()
{
    MarkOrRemember();
    CStoreRegister::SetChangeLost(true);
}

bool WaitForLock(CStoreLock* pLock, unsigned int uPause, const char* szRefused)
{
    return WaitForStoreLock([pLock] { return pLock->TryLock(); }, uPause, szRefused);
}

} // namespace

void MarkForLostChange()
{
    CWriterLock writer;
    CStoreLock lock;
    if (TryStoreLock(&lock, [](int) {}) && writer.Take())
    {
        MarkOrRemember();
    }
    else
    {
        MarkWithoutLock();
    }
}

bool IsStoreWhole()
{
    if (CStoreRegister::IsChangeLost())
    {
        return false;
    }
    tag_ContactReg reg = {};
    if (CStoreRegister::Inspect(&reg) == STORE_WHOLE)
    {
        return true;
    }
    CWriterLock writer;
    CStoreLock lock;
    return TryStoreLock(&lock, [](int) {}) && writer.Take() &&
           CStoreRegister::Inspect(&reg) == STORE_WHOLE;
}

CHeldStore::CHeldStore(CMemManger& manager)
    : m_manager(manager),
      m_bLocked(WaitForStoreLock([&manager] { return manager.TryLockMemo(); }, PATCH_LOCK_PAUSE,
                                 "QV_Contacts: OnContactsTableChanged1 Lock share mem false") &&
                m_writer.Take())
{
}

HOLD_RESULT CHeldStore::Open()
{
    if (!m_bLocked)
    {
        MarkWithoutLock();
        return HOLD_NOTHING;
    }
    tag_ContactReg reg = {};
    const STORE_STATE eState = CStoreRegister::Inspect(&reg);
    if (eState == STORE_MISSING || eState == STORE_DAMAGED)
    {
        return eState == STORE_MISSING ? HOLD_NOTHING : HOLD_REBUILD;
    }
    if (m_manager.OpenWriteShareMem(&m_pRecords, &m_pReg) != 0)
    {
        return MarkOrRemember() ? HOLD_NOTHING : HOLD_REBUILD;
    }
    m_iMappedSlots = m_pRecords != nullptr ? reg.iMemSize : 0;
    QV_LOGD(QV_LOG_TAG, "QV_Contacts: OnContactsTableChanged1 old contact count = %d\n",
            m_pReg->iTotalNum);
    return HOLD_READY;
}

void CHeldStore::Release()
{
    m_manager.CloseWriteShareMem();
    m_manager.UnlockMemo();
}

CHeldRecords::CHeldRecords(const char* szRefused)
    : m_bLocked(WaitForLock(&m_lock, RECORD_LOCK_PAUSE, szRefused) && m_writer.Take())
{
}

bool CHeldRecords::Open()
{
    if (!m_bLocked)
    {
        MarkWithoutLock();
        return false;
    }
    const STORE_STATE eState = CStoreRegister::Read(&m_reg);
    if (m_reg.iTotalNum > 0 &&
        m_records.Open(CDataPaths::ContactRecords(), StoreBytes(m_reg.iTotalNum)))
    {
        return true;
    }
    if (m_reg.iTotalNum > 0 || eState == STORE_UNREADABLE)
    {
        MarkOrRemember();
    }
    return false;
}

void CHeldRecords::Release()
{
    m_records.Close();
    m_lock.Release();
}

int CHeldRecords::Find(long iContactID)
{
    if (!Open())
    {
        return -1;
    }
    for (int i = 0; i < m_reg.iTotalNum; ++i)
    {
        if (Records()[i].iContactID == iContactID)
        {
            return i;
        }
    }
    return -1;
}
