#ifndef QV_DBOPERATOR_STATUSINDEX_H
#define QV_DBOPERATOR_STATUSINDEX_H

#include "Core/Records/ContactRecords.h"

#include <memory>

// Finds the first record with a status id, in the same time whatever the number of records. The
// records stay the caller's and keep their status ids while the index is used.
class CStatusIndex
{
public:
    // One pass over the records. Without memory for the table every First walks the records.
    CStatusIndex(tag_ContactsStruct* pContacts, int iCount);

    // The first record, in array order, whose iStatusUpdateID is the id; null when there is none.
    tag_ContactsStruct* First(int iStatusId) const;

private:
    void MakeTable();
    size_t Slot(int iStatusId) const;
    tag_ContactsStruct* Walk(int iStatusId) const;

    tag_ContactsStruct* m_pContacts;
    int m_iCount;
    int m_iBits;                         // the table has 2 to this power slots
    std::unique_ptr<int32_t[]> m_pTable; // place of a record + 1, or 0; at most half full
};

#endif
