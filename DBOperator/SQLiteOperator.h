#ifndef QV_DBOPERATOR_SQLITEOPERATOR_H
#define QV_DBOPERATOR_SQLITEOPERATOR_H

#include "DBOperator/DBOperator.h"

struct sqlite3;
class CSqlIdList;

// Reads the provider's database file, CDataPaths::Database(), and never writes to it.
//
// The first operation opens the connection, which stays open until close(), the destructor, or the
// end of ReadAllLocalizer's last query or of ReadContactsByID; an operation that fails before that
// leaves it open. If a writer keeps the database busy, the queries are prepared again: the counts
// and the online query four times in all, 100 ms apart, the record queries of ReadAllLocalizer
// without limit. A count's step is retried three times, 20 ms apart.
//
// The two record queries have no ORDER BY and are merged in one pass: the rows of `localizer` must
// come in the order of `contacts`, as they do with integer primary keys. ReadAllLocalizer returns
// -1 if a visible contact has no name row in that pass; of names and keys that are not valid UTF-8
// the part before the fault is kept.
//
// Lines go to the tag "QV_ContactsLocalize_SO": progress at debug priority; failures, and waits for
// a busy database, at error priority. Only the wait of ReadAllSmsOnlineStatus is a debug line.
class QV_EXPORT CSQLiteOperator : public CDBOperator
{
public:
    CSQLiteOperator();
    ~CSQLiteOperator() override;
    CSQLiteOperator(const CSQLiteOperator&) = delete;
    CSQLiteOperator& operator=(const CSQLiteOperator&) = delete;

    // 0, also if the connection is already open; -1 with one line if the file is missing (it is not
    // created) or cannot be opened. A file that is no database fails with the first query.
    int open();
    void close();

    int GetContactsCount(int* piCount) override;
    int ReadAllLocalizer(tag_ContactsInfo* pRecord, long lCount, long long* pIds) override;
    int ReadContactsByID(int iContactID, tag_ContactsStruct* pContact, int& iFound) override;
    int ReadAllSmsOnlineStatus(tag_ContactsInfo* pRecord, long lCount, long long* pIds) override;

    // --- For callers outside: nothing in the library calls this, nor ReadContactsByID ---

    // Stores the ids of a list like "3.12.40" in pIds, at most iMax, and leaves the elements after
    // them alone. An empty place between dots is a 0; a character that is neither digit nor dot
    // ends the list and drops the number before it; numbers wrap at 32 bits. Does nothing for a
    // null argument or an empty text.
    void ParseIDString(const char* szText, QVLong32* pIds, int iMax);

private:
    QV_INTERNAL int EnsureOpen();
    QV_INTERNAL int CountContacts(const CSqlIdList& ids, tag_ContactsInfo* pRecord);
    QV_INTERNAL int ReadContacts(const CSqlIdList& ids, tag_ContactsInfo* pRecord);
    QV_INTERNAL int ReadLocalizer(const CSqlIdList& ids, tag_ContactsInfo* pRecord);
    QV_INTERNAL int ReadContactRow(int iContactID, tag_ContactsStruct* pContact, int& iFound);
    QV_INTERNAL int ReadLocalizerRow(int iContactID, tag_ContactsStruct* pContact, int& iFound);

    sqlite3* m_pDB; // null while closed
};

#endif
