#ifndef QV_MEMMANAGER_SLOTPLAN_H
#define QV_MEMMANAGER_SLOTPLAN_H

#include "Common/CommonQsort.h"
#include "Core/Records/ContactRecords.h"

// Where stored records go when some leave and others join them, found out before any is moved:
// each then moves once, however many leave and join. Everything is as if one after the other had
// been taken out and put in.
class CSlotPlan
{
public:
    // How many records can leave, and how many can join: as many as one notification lists.
    static constexpr int MAX_CHANGES = 200;

    // For iCount records in a shared mapping of the store, in the order eOrder, of which those of
    // iRemoved slots, listed in increasing order, leave. Both have to stay as they are until Apply.
    CSlotPlan(tag_ContactsStruct* pRecords, int iCount, const int* piRemoved, int iRemoved,
              Common_Sort_enum eOrder);

    // Records once the plan is carried out.
    int Count() const { return m_iCount - m_iRemoved + m_iInserted; }
    bool IsFull() const { return m_iInserted == MAX_CHANGES; }
    // Finds the slot of a record among those that are there by then, itself the latest, and makes
    // that slot its iSortIndex. The record has to live until Apply; the plan is not full.
    void Insert(tag_ContactsStruct& record);
    // The record that comes to be in the slot, which is below Count().
    tag_ContactsStruct* At(int iSlot) const;

    // Moves the records and stores those that join.
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
    static constexpr int MAX_RUNS = 2 * MAX_CHANGES + 1; // each change ends one

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
