#include "tools/ContactImport.h"

#include "tools/ToolError.h"

#include <algorithm>
#include <limits>
#include <sstream>

namespace
{

constexpr const char* GROUP_TABLE = "CREATE TABLE IF NOT EXISTS qv_imported_groups"
                                    " (group_id INTEGER PRIMARY KEY, name TEXT NOT NULL UNIQUE)";
constexpr const char* UID_TABLE = "CREATE TABLE IF NOT EXISTS qv_imported_uids"
                                  " (uid TEXT PRIMARY KEY, contact_id INTEGER NOT NULL)";
constexpr const char* LAST_ID =
    "SELECT max(id) FROM (SELECT max(_id) AS id FROM contacts UNION ALL"
    " SELECT max(_id) FROM visible_contacts UNION ALL SELECT max(contact_id) FROM localizer"
    " UNION ALL SELECT max(contact_id) FROM qv_imported_uids)";

// Creates the table with its statement szTable; returns the database.
const CSqliteDatabase& WithTable(const CSqliteDatabase& database, const char* szTable)
{
    CSqliteStatement(database, szTable).Step();
    return database;
}

bool IsNumber(const std::string& strText)
{
    constexpr size_t MAX_DIGITS = 10;
    return !strText.empty() && strText.size() <= MAX_DIGITS &&
           std::all_of(strText.begin(), strText.end(), [](char c) { return c >= '0' && c <= '9'; });
}

// The numbers of a list like "3.12.40".
std::vector<int64_t> IdsOf(const std::string& strIds)
{
    std::vector<int64_t> vIds;
    std::istringstream ids(strIds);
    for (std::string strId; std::getline(ids, strId, '.');)
    {
        if (IsNumber(strId))
        {
            vIds.push_back(std::stoll(strId));
        }
    }
    return vIds;
}

std::string Joined(const std::vector<int64_t>& vIds)
{
    std::string strIds;
    for (const int64_t llID : vIds)
    {
        strIds += (strIds.empty() ? "" : ".") + std::to_string(llID);
    }
    return strIds;
}

bool IsSame(const tag_DatabaseContact& one, const tag_DatabaseContact& other)
{
    return one.strName == other.strName && one.strKey == other.strKey &&
           one.strGroups == other.strGroups && one.bMail == other.bMail &&
           one.bAddress == other.bAddress && one.bStarred == other.bStarred &&
           one.bPhone == other.bPhone;
}

} // namespace

CImportedGroups::CImportedGroups(const CSqliteDatabase& database)
    : m_add(WithTable(database, GROUP_TABLE),
            "INSERT INTO qv_imported_groups (group_id, name) VALUES (?, ?)")
{
    CSqliteStatement ours(database, "SELECT name, group_id FROM qv_imported_groups");
    while (ours.Step())
    {
        m_ids[ours.Text(0)] = ours.Number(1);
        m_ours.insert(ours.Number(1));
        m_llNext = std::max(m_llNext, ours.Number(1) + 1);
    }
    CSqliteStatement used(database, "SELECT DISTINCT group_id FROM localizer");
    while (used.Step())
    {
        for (const int64_t llID : IdsOf(used.Text(0)))
        {
            m_llNext = std::max(m_llNext, llID + 1);
        }
    }
}

std::string CImportedGroups::Renewed(const std::string& strIds,
                                     const std::vector<std::string>& vNames)
{
    std::vector<int64_t> vIds = IdsOf(strIds);
    const auto IsReplaced = [this](int64_t llID) { return IsOurs(llID); };
    vIds.erase(std::remove_if(vIds.begin(), vIds.end(), IsReplaced), vIds.end());
    std::set<int64_t> named;
    for (const std::string& strName : vNames)
    {
        named.insert(IdOf(strName));
    }
    vIds.insert(vIds.end(), named.begin(), named.end());
    return Joined(vIds);
}

int64_t CImportedGroups::IdOf(const std::string& strName)
{
    const auto found = m_ids.find(strName);
    int64_t llID = found == m_ids.end() ? 0 : found->second;
    if (llID == 0)
    {
        llID = m_llNext++;
        m_add.Run(llID, strName);
        m_ids[strName] = llID;
        m_ours.insert(llID);
    }
    m_named[strName] = llID;
    return llID;
}

CImportedContacts::CImportedContacts(const CSqliteDatabase& database)
    : m_setUid(WithTable(database, UID_TABLE),
               "INSERT OR REPLACE INTO qv_imported_uids (uid, contact_id) VALUES (?, ?)")
{
    CSqliteStatement uids(database, "SELECT uid, contact_id FROM qv_imported_uids"
                                    " WHERE contact_id IN (SELECT _id FROM contacts)"
                                    " AND contact_id IN (SELECT contact_id FROM localizer)");
    while (uids.Step())
    {
        m_uids[uids.Text(0)] = uids.Number(1);
    }
    CSqliteStatement names(database,
                           "SELECT display_name, contact_id, contact_id IN"
                           " (SELECT contact_id FROM qv_imported_uids) FROM localizer"
                           " JOIN visible_contacts ON visible_contacts._id = contact_id"
                           " JOIN contacts ON contacts._id = contact_id ORDER BY contact_id");
    while (names.Step())
    {
        Waiting& waiting = names.Number(2) != 0 ? m_withUid : m_withoutUid;
        waiting[names.Text(0)].push_back(names.Number(1));
    }
    CSqliteStatement last(database, LAST_ID);
    last.Step();
    m_llLast = std::max<int64_t>(last.Number(0), 0);
}

int64_t CImportedContacts::Find(const tag_ImportEntry& entry)
{
    const auto found = entry.strUid.empty() ? m_uids.end() : m_uids.find(entry.strUid);
    if (found != m_uids.end())
    {
        m_foundByUid.insert(found->second);
        return found->second;
    }
    const int64_t llID = FindByName(m_withoutUid, entry.strName);
    return llID == 0 && entry.strUid.empty() ? FindByName(m_withUid, entry.strName) : llID;
}

int64_t CImportedContacts::FindByName(Waiting& names, const std::string& strName)
{
    const auto found = names.find(strName);
    while (found != names.end() && !found->second.empty())
    {
        const int64_t llID = found->second.front();
        found->second.pop_front();
        if (m_foundByUid.count(llID) == 0)
        {
            return llID;
        }
    }
    return 0;
}

int64_t CImportedContacts::NewId()
{
    if (m_llLast >= std::numeric_limits<int32_t>::max())
    {
        throw CToolError(TOOL_EXIT_FAILED, "the database has no id left for a new contact");
    }
    return ++m_llLast;
}

void CImportedContacts::SetUid(int64_t llID, const std::string& strUid)
{
    const auto found = m_uids.find(strUid);
    if (!strUid.empty() && (found == m_uids.end() || found->second != llID))
    {
        m_uids[strUid] = llID;
        m_setUid.Run(strUid, llID);
    }
}

CContactImport::CContactImport(CContactDatabase& database, CLocalizerKeys& keys)
    : m_database(database), m_keys(keys), m_groups(database.Connection()),
      m_contacts(database.Connection())
{
}

IMPORT_RESULT CContactImport::Apply(const tag_ImportEntry& entry)
{
    tag_DatabaseContact contact;
    contact.llID = m_contacts.Find(entry);
    const bool bNew = contact.llID == 0;
    if (bNew)
    {
        contact.llID = m_contacts.NewId();
    }
    else if (!m_database.Read(contact))
    {
        throw CToolError(TOOL_EXIT_FAILED, "the database has no contact " +
                                               std::to_string(contact.llID) + " any more");
    }
    m_contacts.SetUid(contact.llID, entry.strUid);
    const tag_DatabaseContact before = contact;
    Renew(contact, entry);
    if (!bNew && IsSame(before, contact))
    {
        return IMPORT_UNCHANGED;
    }
    m_changed.insert(contact.llID);
    if (bNew)
    {
        m_database.Add(contact);
        return IMPORT_ADDED;
    }
    m_database.Update(contact);
    return IMPORT_UPDATED;
}

void CContactImport::Renew(tag_DatabaseContact& contact, const tag_ImportEntry& entry)
{
    contact.strName = entry.strName;
    contact.strKey = m_keys.KeyOf(entry.strName);
    contact.bPhone = entry.bPhone.value_or(contact.bPhone);
    contact.bMail = entry.bMail.value_or(contact.bMail);
    contact.bAddress = entry.bAddress.value_or(contact.bAddress);
    contact.bStarred = entry.bStarred.value_or(contact.bStarred);
    if (entry.vGroups)
    {
        contact.strGroups = m_groups.Renewed(contact.strGroups, *entry.vGroups);
    }
}
