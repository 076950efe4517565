#ifndef QV_TOOLS_CONTACTIMPORT_H
#define QV_TOOLS_CONTACTIMPORT_H

#include "tools/ContactDatabase.h"
#include "tools/ImportEntry.h"
#include "tools/LocalizerKeys.h"

#include <cstdint>
#include <deque>
#include <map>
#include <set>
#include <string>
#include <unordered_map>
#include <unordered_set>
#include <vector>

// The groups of imported contacts: a table of the tool's own keeps the id of every name, distinct
// from all other group ids in the database.
class CImportedGroups
{
public:
    explicit CImportedGroups(const CSqliteDatabase& database);

    // The list of ids with the ids of the table replaced by those of the named groups; other ids
    // stay.
    std::string Renewed(const std::string& strIds, const std::vector<std::string>& vNames);
    // The ids of the groups that this import named, by name.
    const std::map<std::string, int64_t>& Named() const { return m_named; }

private:
    int64_t IdOf(const std::string& strName);
    bool IsOurs(int64_t llID) const { return m_ours.count(llID) != 0; }

    std::map<std::string, int64_t> m_ids;
    std::set<int64_t> m_ours; // the ids of m_ids
    std::map<std::string, int64_t> m_named;
    int64_t m_llNext = 1;
    CSqliteStatement m_add;
};

// Finds the contact of an entry: the one that was imported under the entry's uid, else the first
// visible one of the same name; contacts without a uid come first, and contacts with one match only
// an entry without. Each contact is found once by name, so that two people of one name stay two.
class CImportedContacts
{
public:
    explicit CImportedContacts(const CSqliteDatabase& database);

    // The contact's id, 0 when the entry is new.
    int64_t Find(const tag_ImportEntry& entry);
    // An id that no contact has or had in this database.
    int64_t NewId();
    // Assigns the uid to the contact.
    void SetUid(int64_t llID, const std::string& strUid);

private:
    using Waiting = std::unordered_map<std::string, std::deque<int64_t>>;

    int64_t FindByName(Waiting& names, const std::string& strName);

    std::unordered_map<std::string, int64_t> m_uids;
    Waiting m_withoutUid; // contacts by name, in order of their ids, that no entry matched yet
    Waiting m_withUid;
    std::unordered_set<int64_t> m_foundByUid;
    int64_t m_llLast = 0;
    CSqliteStatement m_setUid;
};

enum IMPORT_RESULT
{
    IMPORT_ADDED,
    IMPORT_UPDATED,
    IMPORT_UNCHANGED,
};

// Imports entries into a database. Fields that an entry does not mention stay as they are.
class CContactImport
{
public:
    CContactImport(CContactDatabase& database, CLocalizerKeys& keys);

    IMPORT_RESULT Apply(const tag_ImportEntry& entry);
    // The contacts that were added or updated, in order.
    const std::set<int64_t>& ChangedIds() const { return m_changed; }
    const CImportedGroups& Groups() const { return m_groups; }

private:
    void Renew(tag_DatabaseContact& contact, const tag_ImportEntry& entry);

    CContactDatabase& m_database;
    CLocalizerKeys& m_keys;
    CImportedGroups m_groups;
    CImportedContacts m_contacts;
    std::set<int64_t> m_changed;
};

#endif
