#ifndef QV_DBOPERATOR_STATUSINDEX_H
#define QV_DBOPERATOR_STATUSINDEX_H

#include "Core/Records/ContactRecords.h"

#include <memory>
#include <utility>

// Finds the first record with a status id by binary search. The records stay the caller's and keep
// their status ids while the index is used.
class CStatusIndex
{
public:
    // Sorts the ids of iCount records. If the allocation fails, every First scans the records.
    CStatusIndex(tag_ContactsStruct* pContacts, int iCount);

    // The first record, in array order, whose iStatusUpdateID is the id; null when there is none.
    tag_ContactsStruct* First(int iStatusId) const;

private:
    using IdAndPlace = std::pair<int32_t, int32_t>;

    tag_ContactsStruct* Walk(int iStatusId) const;

    tag_ContactsStruct* m_pContacts;
    int m_iCount;
    std::unique_ptr<IdAndPlace[]> m_pSorted;
};

#endif
