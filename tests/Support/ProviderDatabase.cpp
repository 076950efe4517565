#include "tests/Support/ProviderDatabase.h"

#include "Common/DataPaths.h"

#include <sqlite3.h>

#include <stdexcept>

namespace
{

constexpr const char* SCHEMA =
    "create table if not exists contacts(_id integer primary key, times_contacted integer, "
    "starred integer, has_phone_number integer, last_time_contacted integer, "
    "single_is_secret integer, photo_file_id integer, status_update_id integer);"
    "create table if not exists visible_contacts(_id integer primary key);"
    "create table if not exists localizer(contact_id integer primary key, display_name text, "
    "localizerkey text, group_id text, account_id text, hasMail integer, hasAddress integer);"
    "create table if not exists status_updates(status_update_data_id integer primary key, "
    "status text);";

// A change waits for readers in other processes.
constexpr int BUSY_TIMEOUT_MS = 20000;

void Check(sqlite3* pDB, int iRetCode)
{
    if (iRetCode != SQLITE_OK && iRetCode != SQLITE_DONE)
    {
        throw std::runtime_error(sqlite3_errmsg(pDB));
    }
}

// One statement; its values are bound from left to right before it runs.
class CChange
{
public:
    CChange(sqlite3* pDB, const char* szSql) : m_pDB(pDB)
    {
        Check(m_pDB, sqlite3_prepare_v2(m_pDB, szSql, -1, &m_pStatement, nullptr));
    }
    ~CChange() { sqlite3_finalize(m_pStatement); }
    CChange(const CChange&) = delete;
    CChange& operator=(const CChange&) = delete;

    CChange& operator<<(long long llValue)
    {
        Check(m_pDB, sqlite3_bind_int64(m_pStatement, ++m_iBound, llValue));
        return *this;
    }
    CChange& operator<<(const std::string& strValue)
    {
        Check(m_pDB, sqlite3_bind_text(m_pStatement, ++m_iBound, strValue.data(),
                                       static_cast<int>(strValue.size()), SQLITE_TRANSIENT));
        return *this;
    }
    void Run() { Check(m_pDB, sqlite3_step(m_pStatement)); }

private:
    sqlite3* m_pDB;
    sqlite3_stmt* m_pStatement = nullptr;
    int m_iBound = 0;
};

} // namespace

CProviderDatabase::CProviderDatabase(const std::string& strPath) : m_pDB(nullptr)
{
    const std::string strFile = strPath.empty() ? CDataPaths::Database() : strPath;
    if (sqlite3_open(strFile.c_str(), &m_pDB) != SQLITE_OK)
    {
        sqlite3_close(m_pDB);
        throw std::runtime_error("cannot open " + strFile);
    }
    sqlite3_busy_timeout(m_pDB, BUSY_TIMEOUT_MS);
    // No test outlives the machine: what the disk holds is of no interest.
    Execute("pragma synchronous=off");
    Execute(SCHEMA);
}

CProviderDatabase::~CProviderDatabase()
{
    sqlite3_close(m_pDB);
}

void CProviderDatabase::Put(const tag_ProviderContact& contact)
{
    (CChange(m_pDB, "insert or replace into contacts values(?,?,?,?,?,?,0,?)")
     << contact.iId << contact.iTimes << contact.bStarred << contact.bPhone << contact.llLastTime
     << contact.bSecret << contact.iStatusId)
        .Run();
    (CChange(m_pDB, "insert or replace into localizer values(?,?,?,?,?,?,?)")
     << contact.iId << contact.strName << contact.strKey << contact.strGroups << contact.strAccounts
     << contact.bMail << contact.bAddress)
        .Run();
    SetVisible(contact.iId, contact.bVisible);
    if (contact.iStatusId != 0)
    {
        SetOnline(contact.iStatusId, contact.bOnline);
    }
}

void CProviderDatabase::PutAll(const std::vector<tag_ProviderContact>& vContacts)
{
    const bool bOwnTransaction = sqlite3_get_autocommit(m_pDB) != 0;
    if (bOwnTransaction)
    {
        Execute("begin");
    }
    for (const tag_ProviderContact& contact : vContacts)
    {
        Put(contact);
    }
    if (bOwnTransaction)
    {
        Execute("commit");
    }
}

void CProviderDatabase::Remove(int iId)
{
    SetVisible(iId, false);
    (CChange(m_pDB, "delete from contacts where _id=?") << iId).Run();
    (CChange(m_pDB, "delete from localizer where contact_id=?") << iId).Run();
}

void CProviderDatabase::SetName(int iId, const std::string& strName, const std::string& strKey)
{
    (CChange(m_pDB, "update localizer set display_name=?, localizerkey=? where contact_id=?")
     << strName << strKey << iId)
        .Run();
}

void CProviderDatabase::SetVisible(int iId, bool bVisible)
{
    const char* szSql = bVisible ? "insert or replace into visible_contacts values(?)"
                                 : "delete from visible_contacts where _id=?";
    (CChange(m_pDB, szSql) << iId).Run();
}

void CProviderDatabase::SetStarred(int iId, bool bStarred)
{
    (CChange(m_pDB, "update contacts set starred=? where _id=?") << bStarred << iId).Run();
}

void CProviderDatabase::SetLastTime(int iId, long long llTime)
{
    (CChange(m_pDB, "update contacts set last_time_contacted=?, "
                    "times_contacted=times_contacted+1 where _id=?")
     << llTime << iId)
        .Run();
}

void CProviderDatabase::SetOnline(int iStatusId, bool bOnline)
{
    const char* szSql = bOnline ? "insert or replace into status_updates values(?,'online')"
                                : "delete from status_updates where status_update_data_id=?";
    (CChange(m_pDB, szSql) << iStatusId).Run();
}

void CProviderDatabase::Execute(const std::string& strSql)
{
    Check(m_pDB, sqlite3_exec(m_pDB, strSql.c_str(), nullptr, nullptr, nullptr));
}
