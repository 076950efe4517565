#ifndef QV_MEMMANAGER_STORECHECK_H
#define QV_MEMMANAGER_STORECHECK_H

// Tells a registration record that can be trusted from a damaged one, before anything is mapped
// by its counts. Whoever reads the store goes through here.

#include "Core/ContactRecords.h"

constexpr int STORE_RECORD_SIZE = static_cast<int>(sizeof(tag_ContactsStruct));

// The largest count whose bytes a 32-bit signed size can hold.
constexpr int STORE_MAX_RECORDS = INT32_MAX / STORE_RECORD_SIZE;

enum STORE_STATE
{
    STORE_MISSING, // no ContactsReg.bin, or one shorter than a record, with nothing bad in it
    STORE_DAMAGED, // counts that no build wrote or that the records file cannot hold
    STORE_GOOD
};

class CStoreCheck
{
public:
    // Whether a record is damaged beside a records file of llFileSize bytes (0 when missing):
    // iTotalNum or iMemSize negative or above STORE_MAX_RECORDS, more contacts than the file
    // holds, or a capacity above both the file's and STORE_SPARE_RECORDS.
    static bool IsDamaged(const tag_ContactReg& reg, int64_t llFileSize);

    // Reads ContactsReg.bin into *pReg, zero-filled where the file ends early; maps, creates and
    // changes nothing. A damaged record is told by an error line.
    static STORE_STATE ReadReg(tag_ContactReg* pReg);

    // Whether a handler has to rebuild the store before it may touch it.
    static bool IsStoreDamaged();

    // What readers do first: maps ContactsReg.bin, copies the record into *pReg and unmaps. 0, or
    // -1 with *pReg untouched when the file is missing, too short or damaged.
    static int MapReg(tag_ContactReg* pReg);
};

// Bytes of iCount records; iCount is 0 to STORE_MAX_RECORDS.
constexpr size_t StoreBytes(int iCount)
{
    return static_cast<size_t>(iCount) * sizeof(tag_ContactsStruct);
}

#endif
