#ifndef QV_TESTS_FAULTS_STORECASE_H
#define QV_TESTS_FAULTS_STORECASE_H

#include "Core/LocalizerLogic.h"
#include "tests/Support/DataDirectory.h"
#include "tests/Support/ProviderDatabase.h"
#include "tests/Support/StoreImage.h"

#include <functional>
#include <map>
#include <ostream>
#include <string>
#include <vector>

// One small change of the provider's database and how the library is told of it.
struct tag_Change
{
    const char* szName;
    std::function<void(CProviderDatabase&)> fnChange;
    std::function<int(CLocalizerLogic&)> fnTell; // 0 where it reports nothing
};
const std::vector<tag_Change>& AllChanges();
inline std::ostream& operator<<(std::ostream& stream, const tag_Change& change)
{
    return stream << change.szName;
}

// What the two files of a store are.
enum STORE_KIND
{
    KIND_NONE,   // no registration record, or one of zeros
    KIND_MARKED, // asks for a rebuild
    KIND_BEFORE, // a build's from the database before the change
    KIND_AFTER,  // or after it
    KIND_WRONG
};

// A store in a data directory of its own, in one of the two orders, whose database has changed
// since. Everything that the library may make of it is built once.
class CStoreCase
{
public:
    CStoreCase(const tag_Change& change, int iSortType);

    const tag_Change& Change() const { return m_change; }
    int SortType() const { return m_iSortType; }
    const tag_StoreImage& Before() const { return m_before; }
    const tag_StoreImage& After(int iSortType) const { return m_aAfter[iSortType == 1 ? 1 : 0]; }
    // The files as they were before the library was told.
    void Restore() const;
    static void Write(const std::string& strReg, const std::string& strRecords, size_t uLength);

    // The store as it is now; empty when there is none.
    static tag_StoreImage Present();
    // The kind of a state. What only the next status notification brings may be missing.
    STORE_KIND KindOf(const tag_StoreImage& image, std::string* pstrWhy) const;
    // What a marked store must not hold: a contact's id beside a name or key that it never had.
    std::string MixedContact(int iContactID, const wchar_t* szName, const wchar_t* szKey) const;
    // Empty when the store is now what a build from the changed database makes.
    std::string RepairFault() const;

private:
    tag_Change m_change;
    bool m_bBuilt; // there is a store before the change
    int m_iSortType;
    CDataDirectory m_directory;
    std::string m_strReg;
    std::string m_strRecords; // those in use
    size_t m_uLength = 0;     // of the records file
    tag_StoreImage m_before;
    tag_StoreImage m_aAfter[2];
    std::multimap<int, std::pair<std::wstring, std::wstring>> m_mapTexts; // names and keys by id
};

#endif
