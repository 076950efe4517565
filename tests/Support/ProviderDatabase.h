#ifndef QV_TESTS_SUPPORT_PROVIDERDATABASE_H
#define QV_TESTS_SUPPORT_PROVIDERDATABASE_H

#include "tools/DatabaseContact.h"
#include "tools/Sqlite.h"

#include <string>
#include <vector>

// A provider database in a real file, changed through a connection of its own as the provider
// would. Any error of SQLite is thrown.
class CProviderDatabase
{
public:
    // Opens the library's database; makes it with empty tables where there is none.
    CProviderDatabase();

    // Inserts the contact, or replaces all its rows. Its status row is set or removed, too, when it
    // has the id of one.
    void Put(const tag_DatabaseContact& contact);
    // All of them in one transaction.
    void PutAll(const std::vector<tag_DatabaseContact>& vContacts);
    // Removes the contact from every table but status_updates.
    void Remove(int iId);

    void SetName(int iId, const std::string& strName, const std::string& strKey);
    void SetVisible(int64_t llID, bool bVisible);
    void SetStarred(int iId, bool bStarred);
    // Stores the time and raises times_contacted by one.
    void SetLastTime(int iId, long long llTime);
    void SetOnline(int64_t llStatusID, bool bOnline);

    // Keeps every other connection from reading until Unlock.
    void LockExclusive() { Execute("begin exclusive"); }
    void Unlock() { Execute("commit"); }

    void Execute(const std::string& strSql) { m_database.Execute(strSql.c_str()); }

private:
    template <typename... Values>
    void Change(const char* szSql, const Values&... values)
    {
        CSqliteStatement(m_database, szSql).Run(values...);
    }

    bool m_bNew;
    CSqliteDatabase m_database;
};

#endif
