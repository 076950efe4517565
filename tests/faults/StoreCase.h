#ifndef QV_TESTS_FAULTS_STORECASE_H
#define QV_TESTS_FAULTS_STORECASE_H

#include "Core/LocalizerLogic.h"
#include "Core/Records/LocalizerCodes.h"
#include "tests/Support/ProviderDatabase.h"
#include "tests/Support/StoreImage.h"

#include <map>
#include <ostream>
#include <string>
#include <vector>

// What the program was started with.
extern unsigned int g_uSeed;
extern unsigned int g_uSeconds; // that the readers run

// What an operation hands out. Nothing in here allocates.
struct tag_Answer
{
    int iRet = 0; // also of one that reports nothing
    tag_LocalizerResult* pResult = nullptr;
    long lMask = 0;
    wchar_t szText[64] = {};
};

// An operation of the facade and, where it tells of one, the change of the database before it.
struct tag_Operation
{
    const char* szName;
    void (*pfnRun)(CLocalizerLogic& logic, tag_Answer& answer);
    void (*pfnChange)(CProviderDatabase& provider) = [](CProviderDatabase&) {};
};
const std::vector<tag_Operation>& AllChanges();
const std::vector<tag_Operation>& AllReadings(); // which leave the store alone; everybody first
inline std::ostream& operator<<(std::ostream& stream, const tag_Operation& operation)
{
    return stream << operation.szName;
}

// Searches the contacts that pass the filter of a kind, 0 for all, or the set.
void Search(CLocalizerLogic& logic, tag_Answer& answer, const wchar_t* szTyped,
            IME_SEARCH_TYPE eType, int iFilter = 0, tag_LocalizerResult* pLast = nullptr);

// Whether it is a result code of the facade's.
inline bool IsResult(int iRet)
{
    return iRet == 0 || iRet == -1 || iRet == LOC_ERR_MAP;
}

// The whole of an answer, whose set is released; "0 nobody" for a search that finds nobody.
std::string TextOf(CLocalizerLogic& logic, const tag_Answer& answer);

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
    CStoreCase(const tag_Operation& change, int iSortType);

    bool Is(const char* szChange) const { return m_strChange == szChange; }
    const tag_StoreImage& After(int iSortType) const { return m_aAfter[iSortType == 1 ? 1 : 0]; }
    // The files as they were before the library was told.
    void Restore() const;
    // An empty one is removed.
    static void Write(const tag_StoreFiles& files);

    // The kind of a state. What only the next status notification brings may be missing.
    STORE_KIND KindOf(tag_StoreImage image, std::string* pstrWhy) const;
    // What a marked store must not hold: a contact's id beside a name or key that it never had.
    std::string MixedContact(int iContactID, const wchar_t* szName, const wchar_t* szKey) const;
    // Empty when the store is now what a build from the changed database makes.
    std::string RepairFault() const;

private:
    std::string m_strChange;
    int m_iSortType;
    CDataDirectory m_directory;
    tag_StoreImage m_before;
    tag_StoreImage m_aAfter[2];
    std::multimap<int, std::pair<std::wstring, std::wstring>> m_mapTexts; // names and keys by id
};

#endif
