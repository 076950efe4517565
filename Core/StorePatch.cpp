#include "Core/StorePatch.h"

#include "Common/Log.h"

#include <algorithm>
#include <atomic>
#include <cstring>
#include <cwchar>

namespace
{

// Keeps the stores before it ahead of those after it, for whoever looks at the files after this
// process was killed in between.
void OrderStores()
{
    std::atomic_thread_fence(std::memory_order_seq_cst);
}

// Moves iCount records within the store by whole records.
void MoveRecords(tag_ContactsStruct* pRecords, int iFrom, int iTo, int iCount)
{
    std::memmove(pRecords + iTo, pRecords + iFrom,
                 static_cast<size_t>(iCount) * sizeof(tag_ContactsStruct));
}

bool IsSameName(const tag_ContactsStruct& a, const tag_ContactsStruct& b)
{
    return std::wcsncmp(a.szName, b.szName, CONTACT_MAX_NAME) == 0;
}

} // namespace

CStoreMark::CStoreMark(tag_ContactReg& reg)
    : m_reg(reg), m_iCapacity(reg.iMemSize), m_iSortType(reg.iSortType)
{
    m_reg.iMemSize = 0;
    OrderStores();
}

void CStoreMark::Finish()
{
    OrderStores();
    if (m_reg.iSortType == m_iSortType)
    {
        m_reg.iMemSize = m_iCapacity;
    }
}

bool CChangedIds::Take(int iContactID)
{
    long long* pEnd = m_pIds + m_iNum;
    long long* pFound = std::find(m_pIds, pEnd, static_cast<long long>(iContactID));
    if (pFound == pEnd)
    {
        return false;
    }
    *pFound = m_pIds[--m_iNum];
    return true;
}

CStorePatch::CStorePatch(tag_ContactsStruct* pRecords, int iCount, int iCapacity, int iSortType)
    : m_pRecords(pRecords), m_iCount(iCount), m_iCapacity(iCapacity), m_iSortType(iSortType)
{
}

int CStorePatch::Match(CChangedIds& ids, tag_ContactsInfo& changed, int* piRemoved)
{
    int iRemoved = 0;
    for (int i = 0; i < m_iCount && !ids.IsEmpty(); ++i)
    {
        if (ids.Take(m_pRecords[i].iContactID) && !Renew(i, changed))
        {
            piRemoved[iRemoved++] = i;
        }
    }
    return iRemoved;
}

// False when the contact is gone or has another name, so that it does not belong here any more.
bool CStorePatch::Renew(int iSlot, tag_ContactsInfo& changed)
{
    tag_ContactsStruct& slot = m_pRecords[iSlot];
    tag_ContactsStruct* pEnd = changed.pContacts + changed.RecordNum;
    tag_ContactsStruct* pFound =
        std::find_if(changed.pContacts, pEnd,
                     [&slot](const tag_ContactsStruct& record)
                     { return record.iContactID == slot.iContactID && IsSameName(record, slot); });
    if (pFound == pEnd)
    {
        return false;
    }
    pFound->iSortIndex = slot.iSortIndex;
    slot = *pFound;
    *pFound = *(pEnd - 1);
    --changed.RecordNum;
    QV_LOGD(QV_LOG_TAG,
            "QV_Contacts: OnContactsTableChanged1 found same item, renew it k=%d, "
            "stRecord.RecordNum=%d",
            static_cast<int>(pFound - changed.pContacts), changed.RecordNum);
    return true;
}

void CStorePatch::Remove(const int* piSlots, int iNum)
{
    for (int i = 0; i < iNum; ++i)
    {
        const int iFrom = piSlots[i] + 1;
        const int iEnd = i + 1 < iNum ? piSlots[i + 1] : m_iCount;
        MoveRecords(m_pRecords, iFrom, iFrom - (i + 1), iEnd - iFrom);
    }
    m_iCount -= iNum;
}

PATCH_RESULT CStorePatch::Insert(tag_ContactsInfo& inserted)
{
    PATCH_RESULT eResult = PATCH_DONE;
    for (int i = 0; i < inserted.RecordNum && eResult == PATCH_DONE; ++i)
    {
        eResult = InsertOne(inserted.pContacts[i]);
    }
    return eResult;
}

PATCH_RESULT CStorePatch::InsertOne(tag_ContactsStruct& record)
{
    if (m_iCount >= m_iCapacity)
    {
        return PATCH_FULL;
    }
    const int iSlot = m_sorter.Search_Bin(reinterpret_cast<char*>(m_pRecords), m_iCount,
                                          reinterpret_cast<char*>(&record),
                                          IsTimeOrder() ? SORT_TIME : SORT_NAME, 1);
    if (iSlot < 0)
    {
        return PATCH_FAILED;
    }
    MoveRecords(m_pRecords, iSlot, iSlot + 1, m_iCount - iSlot);
    record.iSortIndex = iSlot;
    m_pRecords[iSlot] = record;
    ++m_iCount;
    return PATCH_DONE;
}

void CStorePatch::Renumber()
{
    if (IsTimeOrder())
    {
        return;
    }
    for (int i = 0; i < m_iCount; ++i)
    {
        // Records before the first change have their number: their pages stay clean.
        if (m_pRecords[i].iSortIndex != i)
        {
            m_pRecords[i].iSortIndex = i;
        }
    }
}

void CStorePatch::ClearUpTo(int iTotalNum)
{
    const int iEnd = std::min(iTotalNum, m_iCapacity);
    if (iEnd > m_iCount)
    {
        std::memset(static_cast<void*>(m_pRecords + m_iCount), 0,
                    static_cast<size_t>(iEnd - m_iCount) * sizeof(tag_ContactsStruct));
    }
}

void MoveToFront(tag_ContactsStruct* pRecords, int iSlot)
{
    const tag_ContactsStruct moved = pRecords[iSlot];
    MoveRecords(pRecords, 0, 1, iSlot);
    pRecords[0] = moved;
}
