#ifndef QV_MEMMANAGER_STOREREGISTER_H
#define QV_MEMMANAGER_STOREREGISTER_H

// The registration record and its dirty flag: a capacity of 0, called the mark.
//
// Protocol of every change to stored records, under the writer lock:
//   1. Mark, under the store lock too: the capacity becomes 0 and is flushed to the disk before
//      the first record changes;
//   2. the records change, then the count; the store lock is released;
//   3. Lift: the records are flushed to the disk, then the capacity is restored.
// While the writer waits for the disk, searches find the new index. A writer that fails or dies
// before the end of 3, and a machine that loses power, leave the mark, and the next notification
// of contacts or status (or MemInit) rebuilds the index.

#include "Core/Records/ContactRecords.h"

constexpr int STORE_RECORD_SIZE = static_cast<int>(sizeof(tag_ContactsStruct));

// The largest count whose bytes a 32-bit signed size can hold.
constexpr int STORE_MAX_RECORDS = INT32_MAX / STORE_RECORD_SIZE;

// Bytes of iCount records; iCount is 0 to STORE_MAX_RECORDS.
constexpr size_t StoreBytes(int iCount)
{
    return static_cast<size_t>(iCount) * sizeof(tag_ContactsStruct);
}

enum STORE_STATE
{
    STORE_MISSING,    // no ContactsReg.bin, or an empty one
    STORE_UNREADABLE, // there may be a record, but a system call failed to read it
    STORE_DAMAGED,    // counts that no build wrote or that the records file cannot hold
    STORE_MARKED,     // a change is under way or was never completed, or a sort type was set
    STORE_WHOLE
};

enum LIFT_RESULT
{
    LIFT_DONE,
    LIFT_FAILED,      // the mark stays: no capacity, no record, or the disk may lack records
    LIFT_OUT_OF_ORDER // the mark stays: the sort type was set meanwhile
};

class CStoreRegister
{
public:
    // Whether a record is damaged beside a records file of llFileSize bytes (0 when missing):
    // iTotalNum or iMemSize negative or above STORE_MAX_RECORDS, more contacts than the file
    // holds, or a capacity above both the file's and STORE_SPARE_RECORDS.
    static bool IsDamaged(const tag_ContactReg& reg, int64_t llFileSize);

    // Maps ContactsReg.bin, copies the record into *pReg and unmaps. *pReg is all zero unless the
    // state is STORE_MARKED or STORE_WHOLE. A file that cannot be mapped, a missing one included,
    // and a damaged record give an error line. Without the lock the state may be that of a change
    // under way. Inspect does the same, but writes no error line for a missing or empty file.
    static STORE_STATE Read(tag_ContactReg* pReg);
    static STORE_STATE Inspect(tag_ContactReg* pReg);
    // Whether the states that have a record: marked or whole.
    static bool HasRecord(STORE_STATE eState);

    // Marks the record in the file, if there is one. 0, or -1 when that failed. Under both locks,
    // or for a lost change without them: then a running writer may lift the mark.
    static int MarkFile();

    // Step 3, under the writer lock. iSortedBy is the sort type that the records are sorted by.
    static LIFT_RESULT Lift(int iCapacity, int iSortedBy);

    // Sets the sort type of an existing record, marks it and flushes both. Needs no lock: a writer
    // that lifts its mark at the same time notices. Without a valid record nothing is changed or
    // created.
    static void StoreSortType(int iSortType);

    // Whether a change reached neither the store nor, for certain, its mark; the process remembers
    // it until a rebuild succeeds.
    static bool IsChangeLost();
    static void SetChangeLost(bool bLost);

    // The mapped record of a writer that holds both locks; it is not owned. Sort type and capacity
    // are those of construction: a capacity above 0 says that the records are in that order.
    explicit CStoreRegister(tag_ContactReg& reg);
    int SortType() const { return m_iSortType; }
    int Capacity() const { return m_iCapacity; }

    // Step 1. 0, or -1 when the mark may not have reached the disk: nothing may be changed then.
    int Mark();
    // The end of step 2.
    void SetCount(int iTotalNum);

private:
    tag_ContactReg& m_reg;
    int m_iSortType;
    int m_iCapacity;
};

#endif
