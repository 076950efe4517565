#ifndef QV_LOCALIZERIMPL_CONTACTSORT_H
#define QV_LOCALIZERIMPL_CONTACTSORT_H

#include "Common/CommonQsort.h"
#include "Core/Records/ContactRecords.h"

// Sorts iCount records in place, by SORT_NAME or SORT_TIME, into exactly the order that
// Common_Qsort::QuickSort leaves, equal records included: the same steps run on small keys, and
// each record is moved once. If the allocation of the keys fails, the records themselves are
// sorted. Nothing for null or a count below 1.
void SortContacts(tag_ContactsStruct* pRecords, int iCount, Common_Sort_enum type);

#endif
