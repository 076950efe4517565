#include "tools/SampleDatabase.h"

#include "tools/Sqlite.h"
#include "tools/ToolError.h"

#include <filesystem>
#include <system_error>

namespace fs = std::filesystem;

namespace
{

constexpr const char* SCHEMA =
    "CREATE TABLE contacts (_id INTEGER PRIMARY KEY, times_contacted INTEGER NOT NULL DEFAULT 0,"
    " last_time_contacted INTEGER NOT NULL DEFAULT 0, starred INTEGER NOT NULL DEFAULT 0,"
    " has_phone_number INTEGER NOT NULL DEFAULT 0, single_is_secret INTEGER NOT NULL DEFAULT 0,"
    " photo_file_id INTEGER, status_update_id INTEGER);"
    "CREATE TABLE visible_contacts (_id INTEGER PRIMARY KEY);"
    "CREATE TABLE localizer (contact_id INTEGER PRIMARY KEY, display_name TEXT,"
    " localizerkey TEXT, group_id TEXT, account_id TEXT, hasMail INTEGER NOT NULL DEFAULT 0,"
    " hasAddress INTEGER NOT NULL DEFAULT 0);"
    "CREATE TABLE status_updates (status_update_data_id INTEGER PRIMARY KEY, status TEXT);";

// The four inserts that one contact needs.
class CContactWriter
{
public:
    explicit CContactWriter(const CSqliteDatabase& database)
        : m_contacts(database, "INSERT INTO contacts (_id, times_contacted, last_time_contacted,"
                               " starred, has_phone_number, single_is_secret, status_update_id)"
                               " VALUES (?, ?, ?, ?, ?, ?, ?)"),
          m_visible(database, "INSERT INTO visible_contacts (_id) VALUES (?)"),
          m_localizer(database, "INSERT INTO localizer (contact_id, display_name, localizerkey,"
                                " group_id, account_id, hasMail, hasAddress)"
                                " VALUES (?, ?, ?, ?, ?, ?, ?)"),
          m_status(database,
                   "INSERT INTO status_updates (status_update_data_id, status) VALUES (?, ?)")
    {
    }

    void Write(const tag_SampleContact& contact)
    {
        Run(m_contacts, contact.llID, contact.iTimesContacted, contact.llLastTimeContacted,
            contact.bStarred, contact.bPhone, contact.bSecret, contact.llStatusUpdateID);
        Run(m_localizer, contact.llID, contact.strName, contact.strKey, contact.strGroups,
            contact.strAccounts, contact.bMail, contact.bAddress);
        if (contact.bVisible)
        {
            Run(m_visible, contact.llID);
        }
        if (!contact.strStatus.empty())
        {
            Run(m_status, contact.llStatusUpdateID, contact.strStatus);
        }
    }

private:
    template <typename... Values>
    static void Run(CSqliteStatement& statement, const Values&... values)
    {
        int iParameter = 0;
        (statement.Bind(++iParameter, values), ...);
        statement.Step();
        statement.Reset();
    }

    CSqliteStatement m_contacts;
    CSqliteStatement m_visible;
    CSqliteStatement m_localizer;
    CSqliteStatement m_status;
};

void WriteNewFile(const std::string& strPath, const std::vector<tag_SampleContact>& vContacts)
{
    CSqliteDatabase database = CSqliteDatabase::Create(strPath);
    database.Execute(SCHEMA);
    database.Execute("BEGIN");
    {
        CContactWriter writer(database);
        for (const tag_SampleContact& contact : vContacts)
        {
            writer.Write(contact);
        }
    }
    database.Execute("COMMIT");
}

// A journal left beside the old file would be played back into the new one.
void RemoveWithJournals(const std::string& strPath)
{
    for (const char* szEnd : {"", "-journal", "-wal", "-shm"})
    {
        std::error_code error;
        fs::remove(strPath + szEnd, error);
    }
}

} // namespace

void WriteSampleDatabase(const std::string& strPath,
                         const std::vector<tag_SampleContact>& vContacts)
{
    const std::string strNew = strPath + ".new";
    RemoveWithJournals(strNew);
    WriteNewFile(strNew, vContacts);
    RemoveWithJournals(strPath);
    std::error_code error;
    fs::rename(strNew, strPath, error);
    if (error)
    {
        throw CToolError(TOOL_EXIT_FAILED, "cannot write " + strPath + ": " + error.message());
    }
}
