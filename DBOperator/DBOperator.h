#ifndef QV_DBOPERATOR_DBOPERATOR_H
#define QV_DBOPERATOR_DBOPERATOR_H

#include "Common/Export.h"
#include "Core/Records/ContactRecords.h"

// Reads the contacts. Every operation returns 0, or -1 for any failure, and opens the connection if
// it is closed. The order of the virtual operations is part of the interface. One operator is used
// by one thread at a time and takes no lock of the library.
class QV_EXPORT CDBOperator
{
public:
    virtual ~CDBOperator() = default;

    // Stores the number of visible contacts in *piCount, on success only. -1 for a null piCount.
    virtual int GetContactsCount(int* piCount) = 0;

    // Reads the visible contacts into a new array: those among the lCount ids of pIds if lCount is
    // 1 to 200; for any other lCount all of them, with pIds ignored. If the list's text grows too
    // long, its last ids are left out; CSqlIdList::CanListAll tells beforehand. RecordNum and
    // pContacts are overwritten, not released. Once allocated, the array stays in pRecord, also
    // when the result is -1, and the caller releases it with array delete. No visible contact is a
    // success with RecordNum 0 and pContacts untouched. -1 for a null pRecord, and for a null pIds
    // that is needed.
    virtual int ReadAllLocalizer(tag_ContactsInfo* pRecord, long lCount, long long* pIds) = 0;

    // For callers outside: nothing in the library calls this. Fills the caller's zero-filled record
    // with the contact, visible or not, except for iStatusUpdateID. iFound becomes 1 if there is a
    // name row for the contact, else 0; it is valid only if the result is 0. -1 for a null
    // pContact.
    virtual int ReadContactsByID(int iContactID, tag_ContactsStruct* pContact, int& iFound) = 0;

    // Sets CONTACT_FLAG_ONLINE in the records of pRecord, in place, for contacts that are online
    // now and clears it in all others. If several records share a status id, only the first is
    // marked. On -1 no record was changed. lCount and pIds are ignored. -1 for a null pRecord.
    virtual int ReadAllSmsOnlineStatus(tag_ContactsInfo* pRecord, long lCount, long long* pIds) = 0;
};

#endif
