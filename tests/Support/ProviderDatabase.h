#ifndef QV_TESTS_SUPPORT_PROVIDERDATABASE_H
#define QV_TESTS_SUPPORT_PROVIDERDATABASE_H

#include "Common/DataPaths.h"
#include "tools/ContactDatabase.h"

#include <filesystem>
#include <string>
#include <vector>

// The library's database, changed through a connection of its own as the provider would. Any error
// of SQLite is thrown.
class CProviderDatabase
{
public:
    // Makes the database with empty tables where there is none.
    CProviderDatabase()
        : m_bNew(!std::filesystem::exists(CDataPaths::Database())),
          m_database(CSqliteDatabase::Create(CDataPaths::Database()))
    {
        constexpr int BUSY_TIMEOUT_MS = 20000; // a change waits for readers in other processes
        m_database.SetBusyWait(BUSY_TIMEOUT_MS);
        // No test outlives the machine: what the disk holds is of no interest.
        Execute("pragma synchronous=off");
        Execute(m_bNew ? PROVIDER_SCHEMA : "");
    }

    // Inserts the contact, or replaces all its rows. Its status row is set or removed, too, when it
    // has the id of one.
    void Put(const tag_DatabaseContact& contact)
    {
        Change("insert or replace into contacts values(?,?,?,?,?,?,0,?)", contact.llID,
               contact.iTimesContacted, contact.llLastTimeContacted, contact.bStarred,
               contact.bPhone, contact.bSecret, contact.llStatusUpdateID);
        Change("insert or replace into localizer values(?,?,?,?,?,?,?)", contact.llID,
               contact.strName, contact.strKey, contact.strGroups, contact.strAccounts,
               contact.bMail, contact.bAddress);
        SetVisible(contact.llID, contact.bVisible);
        if (contact.llStatusUpdateID != 0)
        {
            SetOnline(contact.llStatusUpdateID, !contact.strStatus.empty());
        }
    }
    // All of them in one transaction.
    void PutAll(const std::vector<tag_DatabaseContact>& vContacts)
    {
        Execute("begin");
        for (const tag_DatabaseContact& contact : vContacts)
        {
            Put(contact);
        }
        Execute("commit");
    }
    // Removes the contact from every table but status_updates.
    void Remove(int iId)
    {
        SetVisible(iId, false);
        Change("delete from contacts where _id=?", iId);
        Change("delete from localizer where contact_id=?", iId);
    }

    void SetName(int iId, const std::string& strName, const std::string& strKey)
    {
        Change("update localizer set display_name=?, localizerkey=? where contact_id=?", strName,
               strKey, iId);
    }
    void SetVisible(int64_t llID, bool bVisible)
    {
        Change(bVisible ? "insert or replace into visible_contacts values(?)"
                        : "delete from visible_contacts where _id=?",
               llID);
    }
    void SetStarred(int iId, bool bStarred)
    {
        Change("update contacts set starred=? where _id=?", bStarred, iId);
    }
    // Stores the time and raises times_contacted by one.
    void SetLastTime(int iId, long long llTime)
    {
        Change("update contacts set last_time_contacted=?, times_contacted=times_contacted+1 "
               "where _id=?",
               llTime, iId);
    }
    void SetOnline(int64_t llStatusID, bool bOnline)
    {
        Change(bOnline ? "insert or replace into status_updates values(?,'online')"
                       : "delete from status_updates where status_update_data_id=?",
               llStatusID);
    }

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
