#ifndef QV_TOOLS_CONTACTDATABASE_H
#define QV_TOOLS_CONTACTDATABASE_H

#include "tools/DatabaseContact.h"
#include "tools/Sqlite.h"

#include <string>

// Makes the provider's tables in an empty database.
extern const char* const PROVIDER_SCHEMA;

// Writes a provider database in one transaction: Commit makes all changes visible to others at
// once; an object destroyed without Commit changes nothing. Every operation throws CToolError.
class CContactDatabase
{
public:
    // A new database; Commit puts it in place of any file at strPath.
    static CContactDatabase Replace(const std::string& strPath);
    // The database at strPath, or a new one where there is none.
    static CContactDatabase Extend(const std::string& strPath);
    ~CContactDatabase();
    CContactDatabase(const CContactDatabase&) = delete;
    CContactDatabase& operator=(const CContactDatabase&) = delete;

    // Writes a contact whose id the database does not have yet.
    void Add(const tag_DatabaseContact& contact);
    // Reads the name, key, groups, starred, phone, mail and address of contact.llID; false when
    // the database has no such contact.
    bool Read(tag_DatabaseContact& contact);
    // Writes what Read reads; everything else of the contact stays.
    void Update(const tag_DatabaseContact& contact);
    void Commit();

    CSqliteDatabase& Connection() { return m_database; }

private:
    CContactDatabase(const std::string& strPath, bool bNew);

    std::string m_strPath;
    bool m_bNew; // lies beside m_strPath until Commit
    CSqliteDatabase m_database;
    bool m_bBegun; // declared before the statements, which need the tables
    CSqliteStatement m_addContact;
    CSqliteStatement m_addVisible;
    CSqliteStatement m_addLocalizer;
    CSqliteStatement m_addStatus;
    CSqliteStatement m_read;
    CSqliteStatement m_updateContact;
    CSqliteStatement m_updateLocalizer;
};

#endif
