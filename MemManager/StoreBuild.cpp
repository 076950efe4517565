#include "MemManager/StoreBuild.h"

#include "Common/DataPaths.h"
#include "Common/Log.h"
#include "MemManager/LockAttempts.h"
#include "MemManager/RecordSlots.h"
#include "MemManager/StoreRegister.h"

namespace
{

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

// A good store is marked once its file is known to be large enough, so that a full disk changes
// nothing. A damaged one is marked before that: the larger file could make its record look good.
int WriteRecords(const tag_ContactsInfo& info, STORE_STATE eOldState)
{
    if (eOldState == STORE_DAMAGED && CStoreRegister::MarkFile() != 0)
    {
        return -1;
    }
    CWriteMapping records(CDataPaths::ContactRecords(),
                          StoreBytes(info.RecordNum + STORE_SPARE_RECORDS));
    if (!records.IsOpen() || CStoreRegister::MarkFile() != 0)
    {
        return -1;
    }
    auto* pSlots = records.As<tag_ContactsStruct>();
    for (int i = 0; i < info.RecordNum; ++i)
    {
        WriteSlot(pSlots + i, info.pContacts + i);
    }
    return records.Flush() ? 0 : -1;
}

BUILD_RESULT WriteReg(int iTotalNum, STORE_STATE eOldState, int iSortedBy)
{
    const CWriteMapping mapping(CDataPaths::ContactReg(), sizeof(tag_ContactReg));
    if (!mapping.IsOpen())
    {
        return BUILD_FAILED;
    }
    auto& reg = *mapping.As<tag_ContactReg>();
    if (!CStoreRegister::HasRecord(eOldState))
    {
        reg.iSortType = iSortedBy; // there was none to keep
    }
    const int iCapacity = iTotalNum + STORE_SPARE_RECORDS;
    return CStoreRegister(reg).Lift(iTotalNum, iCapacity, iSortedBy) ? BUILD_DONE
                                                                     : BUILD_OUT_OF_ORDER;
}

} // namespace

BUILD_RESULT CStoreBuild::Write(const tag_ContactsInfo& info, const int* piSortedBy)
{
    if (info.RecordNum < 0 || info.RecordNum > STORE_MAX_RECORDS - STORE_SPARE_RECORDS)
    {
        return BUILD_FAILED;
    }
    CStoreLock lock;
    if (!TakeLockForBuild(&lock))
    {
        return BUILD_FAILED;
    }
    tag_ContactReg regOld = {};
    const STORE_STATE eOldState = CStoreRegister::Inspect(&regOld);
    if (eOldState == STORE_UNREADABLE)
    {
        return BUILD_FAILED; // its sort type would be lost
    }
    if (info.pContacts != nullptr && WriteRecords(info, eOldState) != 0)
    {
        return BUILD_FAILED;
    }
    const bool bAnyOrder = piSortedBy == nullptr || info.RecordNum == 0;
    return WriteReg(info.RecordNum, eOldState, bAnyOrder ? regOld.iSortType : *piSortedBy);
}
