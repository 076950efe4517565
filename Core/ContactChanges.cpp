// The change handlers of CLocalizerLogic: patches in place under the store lock, and the full
// rebuild where no patch is possible. A rebuild takes the lock itself, so it never runs while a
// handler holds it.

#include "Common/DataPaths.h"
#include "Common/Log.h"
#include "Common/Stopwatch.h"
#include "Core/LocalizerLogic.h"
#include "DBOperator/DBOperator.h"
#include "DBOperator/SqlIdList.h"
#include "LocalizerImpl/QVLocalizerManager.h"
#include "MemManager/HeldStore.h"
#include "MemManager/MemManger.h"
#include "MemManager/StorePatch.h"
#include "MemManager/StoreRegister.h"

#include <algorithm>
#include <cstdint>
#include <memory>
#include <new>

namespace
{

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

// Whether a read of the listed contacts gives them all. The reader uses 32 bits of each id: a
// larger one would name another contact.
bool CanListWhole(int iRecordNum, const long long* pIds)
{
    if (!CSqlIdList::CanListAll(iRecordNum, pIds))
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

// Makes the contact the first record of a store in time order. Returns the capacity to lift the
// mark with, 0 when the mark has to stay.
int SetContactedFirst(const CHeldRecords& store, int iSlot, int64_t llTime)
{
    const CWriteMapping mapping(CDataPaths::ContactReg(), sizeof(tag_ContactReg));
    if (!mapping.IsOpen())
    {
        CStoreRegister::SetChangeLost(true);
        return 0;
    }
    CStoreRegister reg(*mapping.As<tag_ContactReg>());
    if (reg.Mark() != 0)
    {
        return 0;
    }
    SetContacted(store.Records()[iSlot], llTime);
    MoveToFront(store.Records(), iSlot);
    return reg.Capacity();
}

// Without a store no build has completed, and the pinyin table may be missing or partial: it is
// written again. With a store the table is complete and stays as it is.
int CompletePinyinTable()
{
    tag_ContactReg reg = {};
    return CStoreRegister::Inspect(&reg) == STORE_MISSING ? CQVLocalizerManager::InitMapFile() : 0;
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
    return patch.Insert(changed);
}

} // namespace

void CLocalizerLogic::OnContactsTableChanged()
{
    CRecordSet records;
    if (RebuildStore(records.Info()) != 0)
    {
        MarkForLostChange();
    }
}

// Reads, converts, sorts and writes the contacts; what it leaves in record the caller releases.
int CLocalizerLogic::RebuildStore(tag_ContactsInfo& record)
{
    int iRet = CompletePinyinTable();
    if (iRet == 0)
    {
        iRet = m_pDBOperator->ReadAllLocalizer(&record, 0, nullptr);
    }
    if (iRet != 0)
    {
        return iRet;
    }
    ReadOnlineStatus(record);
    int iSortType = STORE_ORDER_NAME;
    if (record.pContacts != nullptr)
    {
        iRet = ReadStoredOrder(iSortType);
        QV_LOGD(QV_LOG_TAG, "QV_Contacts: OnContactsTableChanged  iSortType = %d\n", iSortType);
        iRet = iRet == 0 ? ConvertAndSort(record, iSortType) : iRet;
        if (iRet != 0)
        {
            return iRet;
        }
    }
    QV_LOGD(QV_LOG_TAG, "QV_Contacts: OnContactsTableChanged stRecord.num = %d \n",
            record.RecordNum);
    return WriteSorted(record, iSortType);
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

// Whether the store is complete and has room for the database's contacts, which it counts.
bool CLocalizerLogic::HasRoomForAll(int& iDatabaseCount)
{
    int iTotalNum = 0;
    const int iMemSize = m_pclMemManger->GetMemSize(&iTotalNum);
    if (iTotalNum > iMemSize || CStoreRegister::IsChangeLost())
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
    const HOLD_RESULT eHeld = store.Open();
    if (eHeld != HOLD_READY)
    {
        return eHeld == HOLD_NOTHING;
    }
    CStoreRegister reg(store.Reg());
    const int iStored = store.Reg().iTotalNum;
    const int iCapacity = std::min(reg.Capacity(), store.MappedSlots());
    if (iStored > iCapacity || iDatabaseCount > iCapacity || reg.Mark() != 0)
    {
        return false; // it had room before another process changed it, or it cannot be changed
    }
    CStorePatch patch(store.Records(), iStored, iCapacity, reg.SortType());
    const PATCH_RESULT eResult = ApplyChanges(*m_pDBOperator, patch, iRecordNum, pIds);
    patch.Cover(iDatabaseCount);
    reg.SetCount(iDatabaseCount);
    store.Release();
    if (eResult == PATCH_DONE && patch.Count() == iDatabaseCount)
    {
        CStoreRegister::Lift(iCapacity, reg.SortType());
    }
    QV_LOGD(QV_LOG_TAG, "QV_Contacts: OnContactsTablePartChanged1 EXIT takes %d", watch.Elapsed());
    return eResult != PATCH_FULL;
}

void CLocalizerLogic::OnStatusUpdatesTableChanged(int /*iRecordNum*/, long long* /*pIds*/)
{
    int iTotalNum = 0;
    const int iMemSize = m_pclMemManger->GetMemSize(&iTotalNum);
    const bool bComplete = iMemSize > 0 ? iTotalNum <= iMemSize : !HasUnbuiltContacts(iTotalNum);
    if (!bComplete || CStoreRegister::IsChangeLost() || !RefreshOnlineStatus())
    {
        OnContactsTableChanged();
    }
}

// Whether a store without capacity lacks contacts. An empty one does if the database has some: a
// writer that died before it set the first count leaves it so.
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
    const HOLD_RESULT eHeld = store.Open();
    if (eHeld != HOLD_READY)
    {
        return eHeld == HOLD_NOTHING;
    }
    CStoreRegister reg(store.Reg());
    const int iStored = store.Reg().iTotalNum;
    if (iStored > std::min(reg.Capacity(), store.MappedSlots()))
    {
        QV_LOGD(QV_LOG_TAG,
                "QV_Contacts: OnContactsTableChanged pCR->iTotalNum > pCR->iMemSize MemSize=%d\n",
                reg.Capacity());
        return false;
    }
    if (reg.Mark() != 0)
    {
        return false;
    }
    tag_ContactsInfo stored = {iStored, store.Records()};
    m_pDBOperator->ReadAllSmsOnlineStatus(&stored, 0, nullptr);
    store.Release();
    CStoreRegister::Lift(reg.Capacity(), reg.SortType());
    return true;
}

void CLocalizerLogic::OnContactTimeChanged(long iContactID, long long llTime)
{
    CHeldRecords store("QV_Contacts: OnContactTimeChanged Lock share mem false");
    const int iSlot = store.Find(iContactID);
    if (iSlot < 0)
    {
        return;
    }
    if (store.Reg().iSortType == STORE_ORDER_TIME && iSlot > 0)
    {
        const int iCapacity = SetContactedFirst(store, iSlot, llTime);
        store.Release();
        CStoreRegister::Lift(iCapacity, STORE_ORDER_TIME);
    }
    else
    {
        SetContacted(store.Records()[iSlot], llTime);
    }
}

void CLocalizerLogic::OnContactStarChanged(long iContactID, long lStarred)
{
    CHeldRecords store("QV_Contacts: OnContactStarChanged Lock share mem false");
    const int iSlot = store.Find(iContactID);
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
    CStoreRegister::Read(&reg);
    return reg.iSortType;
}
