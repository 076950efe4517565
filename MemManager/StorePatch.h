#ifndef QV_MEMMANAGER_STOREPATCH_H
#define QV_MEMMANAGER_STOREPATCH_H

// Changes to stored records in place, under the store lock that the caller holds.

#include "Core/Records/ContactRecords.h"

#include <cstdint>

// The ids of a notification that have not been found yet. The array stays the caller's and is
// modified: the last id replaces one that is removed.
class CChangedIds
{
public:
    CChangedIds(long long* pIds, int iNum);

    bool IsEmpty() const { return m_iNum == 0; }
    // Removes the first id that equals the contact's; false when there is none.
    bool Take(int iContactID);

private:
    static constexpr unsigned FILTER_BITS = 4096;
    static constexpr unsigned WORD_BITS = 64;

    long long* m_pIds;
    int m_iNum;
    // A bit for the low bits of each id: most contacts are rejected without searching the list.
    uint64_t m_auFilter[FILTER_BITS / WORD_BITS] = {};
};

enum PATCH_RESULT
{
    PATCH_DONE,
    PATCH_FAILED, // the store holds what was changed so far
    PATCH_FULL    // as PATCH_FAILED: the capacity is too small
};

// Renews, removes and inserts contacts among the stored records and counts them; the caller
// updates the registration record.
class CStorePatch
{
public:
    // iCount records of iCapacity slots in the order of iSortType. pRecords is a shared mapping of
    // the store, null only if iCapacity is 0.
    CStorePatch(tag_ContactsStruct* pRecords, int iCount, int iCapacity, int iSortType);

    int Count() const { return m_iCount; }

    // Looks for the contacts of ids from slot 0 on, as long as there are ids left. A contact that
    // has a record of the same converted name in changed is renewed by it in its slot and keeps
    // its iSortIndex; the record leaves changed, whose last one takes its place. Slots of all
    // other contacts found are listed in piRemoved, as long as the list of ids, in increasing
    // order; their number is returned.
    int Match(CChangedIds& ids, tag_ContactsInfo& changed, int* piRemoved);
    // Notes iNum slots, in increasing order, whose records the next Insert removes. The list has to
    // live until then.
    void Remove(const int* piSlots, int iNum);
    // Removes what Remove noted and inserts the records, whose names are converted, one after
    // another in the store's order; iSortIndex becomes the slot that a record has at that moment.
    // If there is no room for all, the first ones are inserted.
    PATCH_RESULT Insert(tag_ContactsInfo& inserted);
    // Ends the patch of a store whose count will be iTotalNum: clears the slots without a record up
    // to that count, at most to the capacity, and in name order, if records were removed or were to
    // be inserted, numbers all of them by their slots.
    void Cover(int iTotalNum);

private:
    bool Renew(int iSlot, tag_ContactsInfo& changed);
    int InsertSome(tag_ContactsStruct* pRecords, int iNum);
    bool IsTimeOrder() const { return m_iSortType == STORE_ORDER_TIME; }

    tag_ContactsStruct* m_pRecords;
    int m_iCount;
    int m_iCapacity;
    int m_iSortType;
    bool m_bMoved = false;            // records were removed or were to be inserted
    const int* m_piRemoved = nullptr; // slots whose records are to leave
    int m_iRemoved = 0;
};

// Moves the record of iSlot to slot 0 and the records before it one slot up. pRecords is a shared
// mapping of the store.
void MoveToFront(tag_ContactsStruct* pRecords, int iSlot);

#endif
