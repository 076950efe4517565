#include "tests/Support/ProviderDatabase.h"

#include "Common/DataPaths.h"
#include "tools/ContactDatabase.h"

#include <filesystem>

namespace
{

// A change waits for readers in other processes.
constexpr int BUSY_TIMEOUT_MS = 20000;

} // namespace

CProviderDatabase::CProviderDatabase()
    : m_bNew(!std::filesystem::exists(CDataPaths::Database())),
      m_database(CSqliteDatabase::Create(CDataPaths::Database()))
{
    m_database.SetBusyWait(BUSY_TIMEOUT_MS);
    // No test outlives the machine: what the disk holds is of no interest.
    Execute("pragma synchronous=off");
    Execute(m_bNew ? PROVIDER_SCHEMA : "");
}

void CProviderDatabase::Put(const tag_DatabaseContact& contact)
{
    Change("insert or replace into contacts values(?,?,?,?,?,?,0,?)", contact.llID,
           contact.iTimesContacted, contact.llLastTimeContacted, contact.bStarred, contact.bPhone,
           contact.bSecret, contact.llStatusUpdateID);
    Change("insert or replace into localizer values(?,?,?,?,?,?,?)", contact.llID, contact.strName,
           contact.strKey, contact.strGroups, contact.strAccounts, contact.bMail, contact.bAddress);
    SetVisible(contact.llID, contact.bVisible);
    if (contact.llStatusUpdateID != 0)
    {
        SetOnline(contact.llStatusUpdateID, !contact.strStatus.empty());
    }
}

void CProviderDatabase::PutAll(const std::vector<tag_DatabaseContact>& vContacts)
{
    Execute("begin");
    for (const tag_DatabaseContact& contact : vContacts)
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

void CProviderDatabase::SetVisible(int64_t llID, bool bVisible)
{
    Change(bVisible ? "insert or replace into visible_contacts values(?)"
                    : "delete from visible_contacts where _id=?",
           llID);
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

void CProviderDatabase::SetOnline(int64_t llStatusID, bool bOnline)
{
    Change(bOnline ? "insert or replace into status_updates values(?,'online')"
                   : "delete from status_updates where status_update_data_id=?",
           llStatusID);
}
