#include "tests/Support/ProviderDatabase.h"

#include "Common/DataPaths.h"

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

} // namespace

CProviderDatabase::CProviderDatabase(const std::string& strPath)
    : m_database(CSqliteDatabase::Create(strPath.empty() ? CDataPaths::Database() : strPath))
{
    m_database.SetBusyWait(BUSY_TIMEOUT_MS);
    // No test outlives the machine: what the disk holds is of no interest.
    Execute("pragma synchronous=off");
    Execute(SCHEMA);
}

void CProviderDatabase::Put(const tag_ProviderContact& contact)
{
    Change("insert or replace into contacts values(?,?,?,?,?,?,0,?)", contact.iId, contact.iTimes,
           contact.bStarred, contact.bPhone, contact.llLastTime, contact.bSecret,
           contact.iStatusId);
    Change("insert or replace into localizer values(?,?,?,?,?,?,?)", contact.iId, contact.strName,
           contact.strKey, contact.strGroups, contact.strAccounts, contact.bMail, contact.bAddress);
    SetVisible(contact.iId, contact.bVisible);
    if (contact.iStatusId != 0)
    {
        SetOnline(contact.iStatusId, contact.bOnline);
    }
}

void CProviderDatabase::PutAll(const std::vector<tag_ProviderContact>& vContacts)
{
    Execute("begin");
    for (const tag_ProviderContact& contact : vContacts)
    {
        Put(contact);
    }
    Execute("commit");
}

void CProviderDatabase::Remove(int iId)
{
    SetVisible(iId, false);
    Change("delete from contacts where _id=?", iId);
    Change("delete from localizer where contact_id=?", iId);
}

void CProviderDatabase::SetName(int iId, const std::string& strName, const std::string& strKey)
{
    Change("update localizer set display_name=?, localizerkey=? where contact_id=?", strName,
           strKey, iId);
}

void CProviderDatabase::SetVisible(int iId, bool bVisible)
{
    Change(bVisible ? "insert or replace into visible_contacts values(?)"
                    : "delete from visible_contacts where _id=?",
           iId);
}

void CProviderDatabase::SetStarred(int iId, bool bStarred)
{
    Change("update contacts set starred=? where _id=?", bStarred, iId);
}

void CProviderDatabase::SetLastTime(int iId, long long llTime)
{
    Change("update contacts set last_time_contacted=?, times_contacted=times_contacted+1 "
           "where _id=?",
           llTime, iId);
}

void CProviderDatabase::SetOnline(int iStatusId, bool bOnline)
{
    Change(bOnline ? "insert or replace into status_updates values(?,'online')"
                   : "delete from status_updates where status_update_data_id=?",
           iStatusId);
}
