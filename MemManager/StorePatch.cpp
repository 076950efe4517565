#include "MemManager/StorePatch.h"

#include "Common/Log.h"
#include "MemManager/RecordSlots.h"
#include "MemManager/SlotPlan.h"

#include <algorithm>
#include <cwchar>

namespace
{

bool IsSameName(const tag_ContactsStruct& a, const tag_ContactsStruct& b)
{
    return std::wcsncmp(a.szName, b.szName, CONTACT_MAX_NAME) == 0;
}

} // namespace

CChangedIds::CChangedIds(long long* pIds, int iNum) : m_pIds(pIds), m_iNum(iNum)
{
    for (int i = 0; i < iNum; ++i)
    {
        const unsigned uBit = static_cast<unsigned>(pIds[i]) % FILTER_BITS;
        m_auFilter[uBit / WORD_BITS] |= uint64_t{1} << uBit % WORD_BITS;
    }
}

bool CChangedIds::Take(int iContactID)
{
    const unsigned uBit = static_cast<unsigned>(iContactID) % FILTER_BITS;
    if ((m_auFilter[uBit / WORD_BITS] >> uBit % WORD_BITS & 1U) == 0)
    {
        return false;
    }
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

// False when the contact is gone or has another name, and so does not belong in this slot.
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
    WriteSlot(&slot, pFound);
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
    m_piRemoved = piSlots;
    m_iRemoved = iNum;
    m_bMoved = m_bMoved || iNum > 0;
}

PATCH_RESULT CStorePatch::Insert(tag_ContactsInfo& inserted)
{
    m_bMoved = m_bMoved || inserted.RecordNum > 0;
    int iInserted = 0;
    do
    {
        iInserted += InsertSome(inserted.pContacts + iInserted, inserted.RecordNum - iInserted);
    } while (m_iRemoved > 0 || (iInserted < inserted.RecordNum && m_iCount < m_iCapacity));
    return iInserted < inserted.RecordNum ? PATCH_FULL : PATCH_DONE;
}

// Applies as much as one plan holds: the last removals and, if none is left, the first insertions.
// Returns the number of insertions.
int CStorePatch::InsertSome(tag_ContactsStruct* pRecords, int iNum)
{
    const int iRemoved = std::min(m_iRemoved, CSlotPlan::MAX_CHANGES);
    m_iRemoved -= iRemoved;
    CSlotPlan plan(m_pRecords, m_iCount, m_piRemoved + m_iRemoved, iRemoved,
                   IsTimeOrder() ? SORT_TIME : SORT_NAME);
    int iInserted = 0;
    while (m_iRemoved == 0 && iInserted < iNum && plan.Count() < m_iCapacity && !plan.IsFull())
    {
        plan.Insert(pRecords[iInserted++]);
    }
    plan.Apply();
    m_iCount = plan.Count();
    return iInserted;
}

void CStorePatch::Cover(int iTotalNum)
{
    const int iEnd = std::min(iTotalNum, m_iCapacity);
    ClearSlots(m_pRecords + m_iCount, std::max(0, iEnd - m_iCount));
    for (int i = 0; m_bMoved && !IsTimeOrder() && i < iEnd; ++i)
    {
        // Records before the first change keep their number, so their pages stay clean.
        if (m_pRecords[i].iSortIndex != i)
        {
            m_pRecords[i].iSortIndex = i;
        }
    }
}

void MoveToFront(tag_ContactsStruct* pRecords, int iSlot)
{
    const tag_ContactsStruct moved = pRecords[iSlot];
    PrepareSlots(pRecords, 0, iSlot + 1);
    MoveSlots(pRecords, 0, 1, iSlot);
    WriteSlot(pRecords, &moved);
}
