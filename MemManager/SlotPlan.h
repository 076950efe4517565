#ifndef QV_MEMMANAGER_SLOTPLAN_H
#define QV_MEMMANAGER_SLOTPLAN_H

#include "Common/CommonQsort.h"
#include "Core/Records/ContactRecords.h"

// Plans where stored records go when some are removed and others inserted, before any is moved:
// each then moves once, however many changes there are. The result is as if the records had been
// removed and inserted one after another.
class CSlotPlan
{
public:
    // The most removals, and the most insertions, of a plan: as many as one notification lists.
    static constexpr int MAX_CHANGES = 200;

    // For iCount records in a shared mapping of the store, in the order eOrder. The records of the
    // iRemoved slots at piRemoved, in increasing order, are removed. Neither array may change
    // before Apply.
    CSlotPlan(tag_ContactsStruct* pRecords, int iCount, const int* piRemoved, int iRemoved,
              Common_Sort_enum eOrder);

    // The number of records after Apply.
    int Count() const { return m_iCount - m_iRemoved + m_iInserted; }
    bool IsFull() const { return m_iInserted == MAX_CHANGES; }
    // Inserts a record into the plan as it is so far and stores its slot in its iSortIndex. The
    // record has to live until Apply; the plan must not be full.
    void Insert(tag_ContactsStruct& record);
    // The record that will be in the slot, which is below Count().
    tag_ContactsStruct* At(int iSlot) const;

    // Moves the records and writes the inserted ones.
    void Apply() const;

private:
    struct tag_Inserted
    {
        int iSlot;
        tag_ContactsStruct* pRecord;
    };
    struct tag_Run // of records that move by the same distance
    {
        int iFrom;
        int iTo;
        int iCount;
    };
    static constexpr int MAX_RUNS = 2 * MAX_CHANGES + 1; // each change ends at most one

    int CountBefore(int iSlot) const;
    int ListRuns(tag_Run* pRuns) const;
    void Prepare(const tag_Run* pRuns, int iRuns) const;

    tag_ContactsStruct* m_pRecords;
    int m_iCount;
    const int* m_piRemoved;
    int m_iRemoved;
    Common_Sort_enum m_eOrder;
    tag_Inserted m_aInserted[MAX_CHANGES]; // in the order of their slots
    int m_iInserted = 0;
};

#endif
