#ifndef QV_TESTS_SUPPORT_PROVIDERDATABASE_H
#define QV_TESTS_SUPPORT_PROVIDERDATABASE_H

#include "tools/Sqlite.h"

#include <string>
#include <vector>

// One contact as the provider keeps it. What is not set is what most contacts have.
struct tag_ProviderContact
{
    int iId = 0;
    std::string strName{}; // UTF-8
    std::string strKey{};  // localizer codes in UTF-8
    std::string strGroups{};
    std::string strAccounts{};
    long long llLastTime = 0;
    int iTimes = 0;
    int iStatusId = 0;
    bool bStarred = false;
    bool bPhone = false;
    bool bSecret = false;
    bool bMail = false;
    bool bAddress = false;
    bool bVisible = true;
    bool bOnline = false; // writes the row of iStatusId into status_updates
};

// A provider database in a real file, changed through a connection of its own as the provider
// would. Any error of SQLite is thrown.
class CProviderDatabase
{
public:
    // Makes the file (CDataPaths::Database() when no path is given) with its empty tables; an
    // existing database is opened and its tables kept.
    explicit CProviderDatabase(const std::string& strPath = std::string());

    // Inserts the contact, or replaces all its rows. The status row is set or removed too when
    // iStatusId is not 0.
    void Put(const tag_ProviderContact& contact);
    // All of them in one transaction.
    void PutAll(const std::vector<tag_ProviderContact>& vContacts);
    // Removes the contact from every table but status_updates.
    void Remove(int iId);

    void SetName(int iId, const std::string& strName, const std::string& strKey);
    void SetVisible(int iId, bool bVisible);
    void SetStarred(int iId, bool bStarred);
    // Stores the time and raises times_contacted by one.
    void SetLastTime(int iId, long long llTime);
    void SetOnline(int iStatusId, bool bOnline);

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

    CSqliteDatabase m_database;
};

#endif
