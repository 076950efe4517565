#ifndef QV_MEMMANAGER_RECORDSLOTS_H
#define QV_MEMMANAGER_RECORDSLOTS_H

// Stored records are replaced by these functions only. While a slot changes, its contact id is 0:
// if this process dies, each slot holds one complete contact or none. Searches skip slots without
// a contact while the store is marked.

#include "Core/Records/ContactRecords.h"

// Stores one record. pRecord may lie in another slot.
void WriteSlot(tag_ContactsStruct* pSlot, const tag_ContactsStruct* pRecord);

// Moves iCount records from the slots from iFrom on to those from iTo on; they may overlap.
void MoveSlots(tag_ContactsStruct* pSlots, int iFrom, int iTo, int iCount);

// Prepares to replace the slots iFirst to iEnd - 1, most of which have been read: their pages
// become writable at once instead of with a fault each. Only for slots in a shared mapping of a
// file; other memory would lose its contents.
void PrepareSlots(tag_ContactsStruct* pSlots, int iFirst, int iEnd);

// Clears iCount slots: their contact id and all else becomes 0.
void ClearSlots(tag_ContactsStruct* pSlots, int iCount);

#endif
