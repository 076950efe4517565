#ifndef QV_DBOPERATOR_SQLITEOPERATOR_H
#define QV_DBOPERATOR_SQLITEOPERATOR_H

#include "DBOperator/DBOperator.h"

struct sqlite3;
class CSqlIdList;

// Reads the provider's database file, CDataPaths::Database(), and never writes to it.
//
// The connection opens with the first operation and stays open until close(), the destructor, or
// the end of ReadAllLocalizer's last query or of ReadContactsByID; an operation that fails before
// that leaves it open. A database that a writer keeps busy is tried again: the counts and the
// online query four times 100 ms apart, the record queries of ReadAllLocalizer without limit.
//
// The two record queries carry no order of their own and are merged in one pass: the rows of
// `localizer` must come in the order of `contacts`, which integer primary keys bring about.
// ReadAllLocalizer is -1 when a visible contact finds no name row in that pass; names and keys
// that are not valid UTF-8 keep what was decoded before the fault.
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

    // 0, also when the connection is open already; -1 with one line when the file is missing (it
    // is not created) or cannot be opened. Whether it is a database shows in the first query.
    int open();
    void close();

    int GetContactsCount(int* piCount) override;
    int ReadAllLocalizer(tag_ContactsInfo* pRecord, long lCount, long long* pIds) override;
    int ReadContactsByID(int iContactID, tag_ContactsStruct* pContact, int& iFound) override;
    int ReadAllSmsOnlineStatus(tag_ContactsInfo* pRecord, long lCount, long long* pIds) override;

    // Stores the ids of a list like "3.12.40" in pIds, at most iMax, and leaves the elements
    // behind them alone. An empty place between dots is a 0; a character that is neither digit
    // nor dot ends the list and drops the number before it; too large a number wraps at 32 bits.
    // Nothing happens for a null argument or an empty text.
    void ParseIDString(const char* szText, QVLong32* pIds, int iMax);

private:
    QV_INTERNAL int EnsureOpen();
    QV_INTERNAL int CountContacts(const CSqlIdList& clIds, tag_ContactsInfo* pRecord);
    QV_INTERNAL int ReadContacts(const CSqlIdList& clIds, tag_ContactsInfo* pRecord);
    QV_INTERNAL int ReadLocalizer(const CSqlIdList& clIds, tag_ContactsInfo* pRecord);
    QV_INTERNAL int ReadContactRow(int iContactID, tag_ContactsStruct* pContact, int& iFound);
    QV_INTERNAL int ReadLocalizerRow(int iContactID, tag_ContactsStruct* pContact, int& iFound);

    sqlite3* m_pDB; // null while closed
};

#endif
