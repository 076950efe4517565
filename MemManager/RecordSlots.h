#ifndef QV_MEMMANAGER_RECORDSLOTS_H
#define QV_MEMMANAGER_RECORDSLOTS_H

// The only way in which stored records are replaced. While a slot changes, its contact id is 0:
// whoever looks at the file after this process died finds in each slot one contact, whole, or
// none. Searches skip slots without a contact while the store is marked.

#include "Core/Records/ContactRecords.h"

// Stores one record. pRecord may lie in another slot.
void WriteSlot(tag_ContactsStruct* pSlot, const tag_ContactsStruct* pRecord);

// Stores iCount records from slot iTo on; they lie in other slots, from iFrom on.
void MoveSlots(tag_ContactsStruct* pSlots, int iFrom, int iTo, int iCount);

// Makes ready to replace the slots iFirst to iEnd - 1, most of which have been read: their pages
// become writable at once instead of with a fault each. Only for slots in a shared mapping of a
// file; other memory would lose what it holds.
void PrepareSlots(tag_ContactsStruct* pSlots, int iFirst, int iEnd);

// Takes the contacts out of iCount slots.
void ClearSlots(tag_ContactsStruct* pSlots, int iCount);

#endif
