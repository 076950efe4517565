#include "MemManager/SlotPlan.h"

#include "Common/SearchSteps.h"
#include "MemManager/RecordSlots.h"

#include <algorithm>

namespace
{

// A key to compare with the records of a plan.
class CKeyedPlan
{
public:
    CKeyedPlan(const CSlotPlan& plan, tag_ContactsStruct& key, Common_Sort_enum eOrder)
        : m_plan(plan), m_pKey(reinterpret_cast<char*>(&key))
    {
        m_sorter.InitInterData(eOrder);
    }

    bool KeyEquals(int i) { return m_sorter.QSORT_EQ(m_pKey, At(i)) == 1; }
    bool KeyBefore(int i) { return m_sorter.QSORT_LT(m_pKey, At(i)) == 1; }
    bool KeyBehind(int i) { return m_sorter.QSORT_GT(m_pKey, At(i)) == 1; }

private:
    char* At(int i) const { return reinterpret_cast<char*>(m_plan.At(i)); }

    const CSlotPlan& m_plan;
    char* m_pKey;
    Common_Qsort m_sorter;
};

} // namespace

CSlotPlan::CSlotPlan(tag_ContactsStruct* pRecords, int iCount, const int* piRemoved, int iRemoved,
                     Common_Sort_enum eOrder)
    : m_pRecords(pRecords), m_iCount(iCount), m_piRemoved(piRemoved), m_iRemoved(iRemoved),
      m_eOrder(eOrder), m_aInserted()
{
}

// How many of the inserted records will lie before the slot.
int CSlotPlan::CountBefore(int iSlot) const
{
    const tag_Inserted* pEnd = m_aInserted + m_iInserted;
    const tag_Inserted* pFound = std::lower_bound(m_aInserted, pEnd, iSlot,
                                                  [](const tag_Inserted& inserted, int iWanted)
                                                  { return inserted.iSlot < iWanted; });
    return static_cast<int>(pFound - m_aInserted);
}

tag_ContactsStruct* CSlotPlan::At(int iSlot) const
{
    const int iBefore = CountBefore(iSlot);
    if (iBefore < m_iInserted && m_aInserted[iBefore].iSlot == iSlot)
    {
        return m_aInserted[iBefore].pRecord;
    }
    const int iStaying = iSlot - iBefore; // counted among the records that stay
    const int* pFound = std::upper_bound(m_piRemoved, m_piRemoved + m_iRemoved, iStaying,
                                         [this](int iWanted, const int& iRemoved) {
                                             return iWanted < iRemoved - (&iRemoved - m_piRemoved);
                                         });
    return m_pRecords + iStaying + (pFound - m_piRemoved);
}

void CSlotPlan::Insert(tag_ContactsStruct& record)
{
    CKeyedPlan keyed(*this, record, m_eOrder);
    const int iSlot = SearchPlace(keyed, Count());
    tag_Inserted* pPlace = m_aInserted + CountBefore(iSlot);
    tag_Inserted* pEnd = m_aInserted + m_iInserted;
    std::for_each(pPlace, pEnd, [](tag_Inserted& inserted) { ++inserted.iSlot; });
    std::move_backward(pPlace, pEnd, pEnd + 1);
    *pPlace = {iSlot, &record};
    ++m_iInserted;
    record.iSortIndex = iSlot;
}

// Lists the records that stay as runs, first to last, and returns the number of runs.
int CSlotPlan::ListRuns(tag_Run* pRuns) const
{
    int iRuns = 0;
    int iRemoved = 0;
    int iInserted = 0;
    int iTo = 0;
    for (int iFrom = 0; iFrom < m_iCount;)
    {
        const int iLeaving = iRemoved < m_iRemoved ? m_piRemoved[iRemoved] : m_iCount;
        const int iJoining = iInserted < m_iInserted ? m_aInserted[iInserted].iSlot : INT32_MAX;
        const int iNum = std::min(iLeaving - iFrom, iJoining - iTo);
        if (iNum > 0)
        {
            pRuns[iRuns++] = {iFrom, iTo, iNum};
            iFrom += iNum;
            iTo += iNum;
        }
        else if (iLeaving == iFrom)
        {
            ++iFrom;
            ++iRemoved;
        }
        else
        {
            ++iTo;
            ++iInserted;
        }
    }
    return iRuns;
}

// Prepares each stretch of consecutive runs that move.
void CSlotPlan::Prepare(const tag_Run* pRuns, int iRuns) const
{
    int iEnd = 0;
    for (int i = 0; i < iRuns; i = iEnd + 1)
    {
        iEnd = i;
        while (iEnd < iRuns && pRuns[iEnd].iFrom != pRuns[iEnd].iTo)
        {
            ++iEnd;
        }
        if (iEnd > i)
        {
            const tag_Run& last = pRuns[iEnd - 1];
            PrepareSlots(m_pRecords, pRuns[i].iTo, last.iTo + last.iCount);
        }
    }
}

// A record only moves into the slot of one that is removed or moves in the same direction. So
// those that move down go first to last and those that move up last to first, and none is lost.
void CSlotPlan::Apply() const
{
    tag_Run aRuns[MAX_RUNS];
    const int iRuns = ListRuns(aRuns);
    Prepare(aRuns, iRuns);
    for (int i = 0; i < iRuns; ++i)
    {
        if (aRuns[i].iTo < aRuns[i].iFrom)
        {
            MoveSlots(m_pRecords, aRuns[i].iFrom, aRuns[i].iTo, aRuns[i].iCount);
        }
    }
    for (int i = iRuns - 1; i >= 0; --i)
    {
        if (aRuns[i].iTo > aRuns[i].iFrom)
        {
            MoveSlots(m_pRecords, aRuns[i].iFrom, aRuns[i].iTo, aRuns[i].iCount);
        }
    }
    for (int i = 0; i < m_iInserted; ++i)
    {
        WriteSlot(m_pRecords + m_aInserted[i].iSlot, m_aInserted[i].pRecord);
    }
}
