#include "MemManager/StoreBuild.h"

#include "Common/DataPaths.h"
#include "Common/Log.h"
#include "MemManager/Files/MappingGuards.h"
#include "MemManager/Files/StoreLock.h"
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

// A store that is not damaged is marked after its file is extended, so that a full disk changes
// nothing. A damaged one is marked before: the larger file could make its record look valid.
int WriteRecords(const tag_ContactsInfo& info, STORE_STATE eOldState)
{
    if (eOldState == STORE_DAMAGED && CStoreRegister::MarkFile() != 0)
    {
        return -1;
    }
    const CWriteMapping records(CDataPaths::ContactRecords(),
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
    return 0;
}

// Writes sort type and count of a marked record; a new one, all zero, counts as marked.
int WriteReg(int iTotalNum, STORE_STATE eOldState, int iSortedBy)
{
    const CWriteMapping mapping(CDataPaths::ContactReg(), sizeof(tag_ContactReg));
    if (!mapping.IsOpen())
    {
        return -1;
    }
    auto& reg = *mapping.As<tag_ContactReg>();
    if (!CStoreRegister::HasRecord(eOldState))
    {
        reg.iSortType = iSortedBy; // there was none to keep
    }
    CStoreRegister(reg).SetCount(iTotalNum);
    return 0;
}

// Everything but lifting the mark, under both locks. 0 or -1.
int WriteMarked(const tag_ContactsInfo& info, const int* piSortedBy, int* piSortType)
{
    tag_ContactReg regOld = {};
    const STORE_STATE eOldState = CStoreRegister::Inspect(&regOld);
    if (eOldState == STORE_UNREADABLE)
    {
        return -1; // its sort type would be lost
    }
    const int iWritten =
        info.pContacts != nullptr ? WriteRecords(info, eOldState) : CStoreRegister::MarkFile();
    const bool bAnyOrder = piSortedBy == nullptr || info.RecordNum == 0;
    *piSortType = bAnyOrder ? regOld.iSortType : *piSortedBy;
    return iWritten == 0 ? WriteReg(info.RecordNum, eOldState, *piSortType) : -1;
}

} // namespace

BUILD_RESULT CStoreBuild::Write(const tag_ContactsInfo& info, const int* piSortedBy)
{
    if (info.RecordNum < 0 || info.RecordNum > STORE_MAX_RECORDS - STORE_SPARE_RECORDS)
    {
        return BUILD_FAILED;
    }
    int iSortedBy = STORE_ORDER_NAME;
    CWriterLock writer;
    CStoreLock lock;
    if (!TakeLockForBuild(&lock) || !writer.Take() ||
        WriteMarked(info, piSortedBy, &iSortedBy) != 0)
    {
        return BUILD_FAILED;
    }
    lock.Release();
    const LIFT_RESULT eResult =
        CStoreRegister::Lift(info.RecordNum + STORE_SPARE_RECORDS, iSortedBy);
    if (eResult == LIFT_FAILED)
    {
        return BUILD_FAILED;
    }
    return eResult == LIFT_OUT_OF_ORDER ? BUILD_OUT_OF_ORDER : BUILD_DONE;
}
