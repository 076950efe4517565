#include "tools/ContactDatabase.h"

#include "tools/ToolError.h"

#include <filesystem>
#include <system_error>

namespace fs = std::filesystem;

const char* const PROVIDER_SCHEMA =
    "CREATE TABLE contacts (_id INTEGER PRIMARY KEY, times_contacted INTEGER NOT NULL DEFAULT 0,"
    " last_time_contacted INTEGER NOT NULL DEFAULT 0, starred INTEGER NOT NULL DEFAULT 0,"
    " has_phone_number INTEGER NOT NULL DEFAULT 0, single_is_secret INTEGER NOT NULL DEFAULT 0,"
    " photo_file_id INTEGER, status_update_id INTEGER);"
    "CREATE TABLE visible_contacts (_id INTEGER PRIMARY KEY);"
    "CREATE TABLE localizer (contact_id INTEGER PRIMARY KEY, display_name TEXT,"
    " localizerkey TEXT, group_id TEXT, account_id TEXT, hasMail INTEGER NOT NULL DEFAULT 0,"
    " hasAddress INTEGER NOT NULL DEFAULT 0);"
    "CREATE TABLE status_updates (status_update_data_id INTEGER PRIMARY KEY, status TEXT);";

namespace
{

// SQLite would replay a journal left beside the old file into the new one.
void RemoveWithJournals(const std::string& strPath)
{
    for (const char* szEnd : {"", "-journal", "-wal", "-shm"})
    {
        std::error_code error;
        fs::remove(strPath + szEnd, error);
    }
}

std::string NewPath(const std::string& strPath)
{
    return strPath + ".new";
}

CSqliteDatabase Open(const std::string& strPath, bool bNew)
{
    if (!bNew)
    {
        return CSqliteDatabase::OpenForWriting(strPath);
    }
    RemoveWithJournals(NewPath(strPath));
    return CSqliteDatabase::Create(NewPath(strPath));
}

// Keeps changed pages in memory until the commit, since writing them out would exclude readers.
bool Begin(CSqliteDatabase& database, bool bNew)
{
    database.Execute("PRAGMA cache_spill = OFF; BEGIN IMMEDIATE");
    if (bNew)
    {
        database.Execute(PROVIDER_SCHEMA);
    }
    return true;
}

} // namespace

CContactDatabase CContactDatabase::Replace(const std::string& strPath)
{
    return {strPath, true};
}

CContactDatabase CContactDatabase::Extend(const std::string& strPath)
{
    std::error_code error;
    return {strPath, !fs::exists(strPath, error)};
}

CContactDatabase::CContactDatabase(const std::string& strPath, bool bNew)
    : m_strPath(strPath), m_bNew(bNew), m_database(Open(strPath, bNew)),
      m_bBegun(Begin(m_database, bNew)),
      m_addContact(m_database, "INSERT INTO contacts (_id, times_contacted, last_time_contacted,"
                               " starred, has_phone_number, single_is_secret, status_update_id)"
                               " VALUES (?, ?, ?, ?, ?, ?, ?)"),
      m_addVisible(m_database, "INSERT INTO visible_contacts (_id) VALUES (?)"),
      m_addLocalizer(m_database, "INSERT INTO localizer (contact_id, display_name, localizerkey,"
                                 " group_id, account_id, hasMail, hasAddress)"
                                 " VALUES (?, ?, ?, ?, ?, ?, ?)"),
      m_addStatus(m_database,
                  "INSERT INTO status_updates (status_update_data_id, status) VALUES (?, ?)"),
      m_read(m_database, "SELECT display_name, localizerkey, group_id, hasMail, hasAddress,"
                         " starred, has_phone_number FROM localizer"
                         " JOIN contacts ON _id = contact_id WHERE contact_id = ?"),
      m_updateContact(m_database,
                      "UPDATE contacts SET starred = ?, has_phone_number = ? WHERE _id = ?"),
      m_updateLocalizer(m_database,
                        "UPDATE localizer SET display_name = ?, localizerkey = ?, group_id = ?,"
                        " hasMail = ?, hasAddress = ? WHERE contact_id = ?")
{
}

CContactDatabase::~CContactDatabase()
{
    if (m_bNew)
    {
        RemoveWithJournals(NewPath(m_strPath));
    }
}

void CContactDatabase::Add(const tag_DatabaseContact& contact)
{
    m_addContact.Run(contact.llID, contact.iTimesContacted, contact.llLastTimeContacted,
                     contact.bStarred, contact.bPhone, contact.bSecret, contact.llStatusUpdateID);
    m_addLocalizer.Run(contact.llID, contact.strName, contact.strKey, contact.strGroups,
                       contact.strAccounts, contact.bMail, contact.bAddress);
    if (contact.bVisible)
    {
        m_addVisible.Run(contact.llID);
    }
    if (!contact.strStatus.empty())
    {
        m_addStatus.Run(contact.llStatusUpdateID, contact.strStatus);
    }
}

bool CContactDatabase::Read(tag_DatabaseContact& contact)
{
    m_read.Bind(1, contact.llID);
    const bool bFound = m_read.Step();
    if (bFound)
    {
        contact.strName = m_read.Text(0);
        contact.strKey = m_read.Text(1);
        contact.strGroups = m_read.Text(2);
        contact.bMail = m_read.Number(3) != 0;
        contact.bAddress = m_read.Number(4) != 0;
        contact.bStarred = m_read.Number(5) != 0;
        contact.bPhone = m_read.Number(6) != 0;
    }
    m_read.Reset();
    return bFound;
}

void CContactDatabase::Update(const tag_DatabaseContact& contact)
{
    m_updateContact.Run(contact.bStarred, contact.bPhone, contact.llID);
    m_updateLocalizer.Run(contact.strName, contact.strKey, contact.strGroups, contact.bMail,
                          contact.bAddress, contact.llID);
}

void CContactDatabase::Commit()
{
    m_database.Execute("COMMIT");
    if (!m_bNew)
    {
        return;
    }
    RemoveWithJournals(m_strPath);
    std::error_code error;
    fs::rename(NewPath(m_strPath), m_strPath, error);
    if (error)
    {
        throw CToolError(TOOL_EXIT_FAILED, "cannot write " + m_strPath + ": " + error.message());
    }
    m_bNew = false;
}
