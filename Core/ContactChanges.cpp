// The change handlers of CLocalizerLogic: patches in place under the store lock, and the full
// rebuild where a patch cannot do. A rebuild takes the lock itself, so it never runs while a
// handler holds it.

#include "Common/DataPaths.h"
#include "Common/Log.h"
#include "Core/LocalizerLogic.h"
#include "Core/Stopwatch.h"
#include "Core/StorePatch.h"
#include "DBOperator/DBOperator.h"
#include "DBOperator/IdList.h"
#include "LocalizerImpl/QVLocalizerManager.h"
#include "MemManager/MappingGuards.h"
#include "MemManager/MemManger.h"
#include "MemManager/StoreCheck.h"

#include <cstdint>
#include <memory>
#include <new>

namespace
{

// Milliseconds between attempts at the lock.
constexpr unsigned int PATCH_LOCK_PAUSE = 100;
constexpr unsigned int RECORD_LOCK_PAUSE = 50;

constexpr long STARRED = 1;

// Records of the reader, released with the scope.
class CRecordSet
{
public:
    CRecordSet() = default;
    ~CRecordSet() { Release(); }
    CRecordSet(const CRecordSet&) = delete;
    CRecordSet& operator=(const CRecordSet&) = delete;

    tag_ContactsInfo& Info() { return m_info; }
    void Release()
    {
        delete[] m_info.pContacts;
        m_info = {};
    }

private:
    tag_ContactsInfo m_info = {};
};

// The store as the patch and the status refresh hold it: the lock, then both write mappings.
class CHeldStore
{
public:
    // Waits for the lock without limit.
    explicit CHeldStore(CMemManger& manager) : m_manager(manager)
    {
        while (m_manager.LockMemo() == 0)
        {
            QV_LOGE(QV_LOG_TAG, "QV_Contacts: OnContactsTableChanged1 Lock share mem false");
            Sleep(PATCH_LOCK_PAUSE);
        }
    }
    ~CHeldStore() { Release(); }
    CHeldStore(const CHeldStore&) = delete;
    CHeldStore& operator=(const CHeldStore&) = delete;

    bool Open()
    {
        if (m_manager.OpenWriteShareMem(&m_pRecords, &m_pReg) != 0)
        {
            return false;
        }
        QV_LOGD(QV_LOG_TAG, "QV_Contacts: OnContactsTableChanged1 old contact count = %d\n",
                m_pReg->iTotalNum);
        return true;
    }
    void Release()
    {
        m_manager.CloseWriteShareMem();
        m_manager.UnlockMemo();
    }
    tag_ContactsStruct* Records() const { return m_pRecords; }
    tag_ContactReg& Reg() const { return *m_pReg; }

private:
    CMemManger& m_manager;
    tag_ContactsStruct* m_pRecords = nullptr;
    tag_ContactReg* m_pReg = nullptr;
};

// The stored records as the time and star changes hold them: a lock of their own and a write
// mapping of the records in use.
class CHeldRecords
{
public:
    // Waits for the lock without limit, with szRefused for each refusal.
    explicit CHeldRecords(const char* szRefused)
    {
        while (!m_lock.TryLock())
        {
            QV_LOGE(QV_LOG_TAG, "%s", szRefused);
            Sleep(RECORD_LOCK_PAUSE);
        }
    }

    // False when there are no records or they cannot be mapped.
    bool Open()
    {
        return CStoreCheck::MapReg(&m_reg) == 0 && m_reg.iTotalNum > 0 &&
               m_records.Open(CDataPaths::ContactRecords(), StoreBytes(m_reg.iTotalNum));
    }
    // The first slot of the contact, -1 when it is not stored.
    int Find(long iContactID) const
    {
        for (int i = 0; i < m_reg.iTotalNum; ++i)
        {
            if (Records()[i].iContactID == iContactID)
            {
                return i;
            }
        }
        return -1;
    }
    tag_ContactsStruct* Records() const { return m_records.As<tag_ContactsStruct>(); }
    int SortType() const { return m_reg.iSortType; }

private:
    CStoreLock m_lock; // released behind the mapping
    tag_ContactReg m_reg = {};
    CWriteMapping m_records;
};

// Whether a read of the listed contacts gives them all. The reader writes 32 bits of each id: a
// longer one would read another contact.
bool CanListWhole(int iRecordNum, const long long* pIds)
{
    if (!CIdList::CanListAll(iRecordNum, pIds))
    {
        return false;
    }
    for (int i = 0; i < iRecordNum; ++i)
    {
        if (pIds[i] < INT32_MIN || pIds[i] > INT32_MAX)
        {
            return false;
        }
    }
    return true;
}

void SetContacted(tag_ContactsStruct& record, int64_t llTime)
{
    record.llLastTimeContacted = llTime;
    // Unsigned, since a damaged record may hold any number.
    record.iTimesContacted =
        static_cast<int32_t>(static_cast<uint32_t>(record.iTimesContacted) + 1U);
}

// The contact becomes the most recent one, in a store ordered by that.
void SetContactedFirst(tag_ContactsStruct* pRecords, int iSlot, int64_t llTime)
{
    CWriteMapping mapping(CDataPaths::ContactReg(), sizeof(tag_ContactReg));
    if (!mapping.IsOpen())
    {
        return;
    }
    CStoreMark mark(*mapping.As<tag_ContactReg>());
    SetContacted(pRecords[iSlot], llTime);
    MoveToFront(pRecords, iSlot);
    mark.Finish();
}

// The listed contacts, their names converted; 0 or the failing step's code.
int ReadChanged(CDBOperator& reader, int iRecordNum, long long* pIds, tag_ContactsInfo& changed)
{
    int iRet = reader.ReadAllLocalizer(&changed, iRecordNum, pIds);
    if (iRet != 0)
    {
        QV_LOGE(QV_LOG_TAG, "QV_Contacts: OnContactsTableChanged1 ReadAllLocalizer = %d\n", iRet);
        return iRet;
    }
    if (changed.RecordNum > 0)
    {
        iRet = CQVLocalizerManager::TransNameToPY(changed.pContacts, changed.RecordNum);
    }
    if (iRet == 0)
    {
        QV_LOGD(QV_LOG_TAG, "QV_Contacts: OnContactsTableChanged1 stRecord.RecordNum: %d",
                changed.RecordNum);
    }
    return iRet;
}

// Renews, removes and inserts the listed contacts.
PATCH_RESULT ApplyChanges(CDBOperator& reader, CStorePatch& patch, int iRecordNum, long long* pIds)
{
    CRecordSet records;
    tag_ContactsInfo& changed = records.Info();
    if (ReadChanged(reader, iRecordNum, pIds, changed) != 0)
    {
        return PATCH_FAILED;
    }
    const std::unique_ptr<int[]> removed(new (std::nothrow) int[static_cast<size_t>(iRecordNum)]());
    if (removed == nullptr)
    {
        return PATCH_FAILED;
    }
    CChangedIds ids(pIds, iRecordNum);
    const int iRemoved = patch.Match(ids, changed, removed.get());
    QV_LOGD(QV_LOG_TAG,
            "QV_Contacts: OnContactsTablePartChanged1 find matchedNum=%d, stRecord.RecordNum=%d",
            iRemoved, changed.RecordNum);
    patch.Remove(removed.get(), iRemoved);
    const PATCH_RESULT eResult = patch.Insert(changed);
    if (iRemoved > 0 || changed.RecordNum > 0)
    {
        patch.Renumber();
    }
    return eResult;
}

} // namespace

void CLocalizerLogic::OnContactsTableChanged()
{
    CRecordSet records;
    if (RebuildStore(records.Info()) != 0)
    {
        // The change is not in the store: the next notification has to try again. Setting the
        // sort type that is set asks for that.
        m_pclMemManger->SetSortType(m_pclMemManger->GetSortType());
    }
}

// Reads, converts, sorts and writes the contacts; what it leaves in record the caller releases.
int CLocalizerLogic::RebuildStore(tag_ContactsInfo& record)
{
    int iRet = m_pDBOperator->ReadAllLocalizer(&record, 0, nullptr);
    if (iRet != 0)
    {
        return iRet;
    }
    ReadOnlineStatus(record);
    if (record.pContacts != nullptr)
    {
        const int iSortType = m_pclMemManger->GetSortType();
        QV_LOGD(QV_LOG_TAG, "QV_Contacts: OnContactsTableChanged  iSortType = %d\n", iSortType);
        iRet = SortByStoredOrder(record, iSortType);
        if (iRet != 0)
        {
            return iRet;
        }
    }
    QV_LOGD(QV_LOG_TAG, "QV_Contacts: OnContactsTableChanged stRecord.num = %d \n",
            record.RecordNum);
    return m_pclMemManger->InitContactRecord(&record);
}

void CLocalizerLogic::OnContactsTableChanged(int iRecordNum, long long* pIds)
{
    const CStopwatch watch;
    if (pIds == nullptr)
    {
        return;
    }
    QV_LOGD(QV_LOG_TAG, "QV_Contacts: OnContactsTableChanged1 iRecordNum = %d\n", iRecordNum);
    if (iRecordNum <= 0)
    {
        return;
    }
    int iDatabaseCount = 0;
    if (!CanListWhole(iRecordNum, pIds) || !HasRoomForAll(iDatabaseCount) ||
        !PatchStore(iDatabaseCount, iRecordNum, pIds, watch))
    {
        OnContactsTableChanged();
    }
}

// Whether the store is complete and has room for the database's contacts, whose number it tells.
bool CLocalizerLogic::HasRoomForAll(int& iDatabaseCount)
{
    int iTotalNum = 0;
    const int iMemSize = m_pclMemManger->GetMemSize(&iTotalNum);
    if (iTotalNum > iMemSize)
    {
        return false;
    }
    QV_LOGD(QV_LOG_TAG,
            "QV_Contacts: OnContactsTableChanged1 m_pclMemManger->GetMemSize; memSize = %d "
            "memContactsNum = %d",
            iMemSize, iTotalNum);
    if (m_pDBOperator->GetContactsCount(&iDatabaseCount) != 0)
    {
        return false;
    }
    QV_LOGD(QV_LOG_TAG, "QV_Contacts: OnContactsTableChanged1 GetContactsCount = %d\n",
            iDatabaseCount);
    if (iDatabaseCount > iMemSize)
    {
        return false;
    }
    QV_LOGD(QV_LOG_TAG,
            "QV_Contacts: OnContactsTableChanged1 contactCount less than memSize, right!");
    return true;
}

// Patches the listed contacts in place under the lock. False when the store has to be rebuilt
// instead; the lock is free again then. The registration record ends with the database's count,
// and with its capacity only when the store really holds that many contacts.
bool CLocalizerLogic::PatchStore(int iDatabaseCount, int iRecordNum, long long* pIds,
                                 const CStopwatch& watch)
{
    CHeldStore store(*m_pclMemManger);
    if (!store.Open())
    {
        return !CStoreCheck::IsStoreDamaged();
    }
    const int iStored = store.Reg().iTotalNum;
    CStoreMark mark(store.Reg());
    if (iStored > mark.Capacity() || iDatabaseCount > mark.Capacity())
    {
        return false; // it had room before another process changed it
    }
    CStorePatch patch(store.Records(), iStored, mark.Capacity(), mark.SortType());
    const PATCH_RESULT eResult = ApplyChanges(*m_pDBOperator, patch, iRecordNum, pIds);
    patch.ClearUpTo(iDatabaseCount);
    store.Reg().iTotalNum = iDatabaseCount;
    if (eResult == PATCH_DONE && patch.Count() == iDatabaseCount)
    {
        mark.Finish();
    }
    store.Release();
    QV_LOGD(QV_LOG_TAG, "QV_Contacts: OnContactsTablePartChanged1 EXIT takes %d", watch.Elapsed());
    return eResult != PATCH_FULL;
}

void CLocalizerLogic::OnStatusUpdatesTableChanged(int /*iRecordNum*/, long long* /*pIds*/)
{
    int iTotalNum = 0;
    const int iMemSize = m_pclMemManger->GetMemSize(&iTotalNum);
    const bool bComplete = iMemSize > 0 ? iTotalNum <= iMemSize : !HasUnbuiltContacts(iTotalNum);
    if (!bComplete || !RefreshOnlineStatus())
    {
        OnContactsTableChanged();
    }
}

// Whether a store without capacity lacks contacts. An empty one does when the database has some:
// a writer that died before it counted its first contact leaves that.
bool CLocalizerLogic::HasUnbuiltContacts(int iTotalNum)
{
    int iDatabaseCount = 0;
    return iTotalNum > 0 ||
           (m_pDBOperator->GetContactsCount(&iDatabaseCount) == 0 && iDatabaseCount > 0);
}

// Recomputes the online bits in place under the lock. False when the store has to be rebuilt
// instead; the lock is free again then.
bool CLocalizerLogic::RefreshOnlineStatus()
{
    CHeldStore store(*m_pclMemManger);
    if (!store.Open())
    {
        return !CStoreCheck::IsStoreDamaged();
    }
    const tag_ContactReg reg = store.Reg();
    if (reg.iTotalNum > reg.iMemSize)
    {
        QV_LOGD(QV_LOG_TAG,
                "QV_Contacts: OnContactsTableChanged pCR->iTotalNum > pCR->iMemSize MemSize=%d\n",
                reg.iMemSize);
        return false;
    }
    CStoreMark mark(store.Reg());
    tag_ContactsInfo stored = {reg.iTotalNum, store.Records()};
    m_pDBOperator->ReadAllSmsOnlineStatus(&stored, 0, nullptr);
    mark.Finish();
    return true;
}

void CLocalizerLogic::OnContactTimeChanged(long iContactID, long long llTime)
{
    CHeldRecords store("QV_Contacts: OnContactTimeChanged Lock share mem false");
    const int iSlot = store.Open() ? store.Find(iContactID) : -1;
    if (iSlot < 0)
    {
        return;
    }
    if (store.SortType() == STORE_ORDER_TIME && iSlot > 0)
    {
        SetContactedFirst(store.Records(), iSlot, llTime);
    }
    else
    {
        SetContacted(store.Records()[iSlot], llTime);
    }
}

void CLocalizerLogic::OnContactStarChanged(long iContactID, long lStarred)
{
    CHeldRecords store("QV_Contacts: OnContactStarChanged Lock share mem false");
    const int iSlot = store.Open() ? store.Find(iContactID) : -1;
    if (iSlot < 0)
    {
        return;
    }
    uint32_t& uFlags = store.Records()[iSlot].iFlags;
    uFlags = lStarred == STARRED ? uFlags | CONTACT_FLAG_STARRED : uFlags & ~CONTACT_FLAG_STARRED;
}

int CLocalizerLogic::OnGetSortType()
{
    tag_ContactReg reg = {};
    return CStoreCheck::MapReg(&reg) == 0 ? reg.iSortType : STORE_ORDER_NAME;
}
