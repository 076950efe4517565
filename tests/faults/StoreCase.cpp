#include "tests/faults/StoreCase.h"

#include "Common/DataPaths.h"
#include "tests/Support/StoreFiles.h"

#include <algorithm>
#include <filesystem>
#include <initializer_list>
#include <stdexcept>

namespace fs = std::filesystem;

namespace
{

constexpr long long FIRST_TIME = 1'600'000'000'000;
constexpr int FIRST_STATUS = 1000;
constexpr const char* NAMES[] = {"张安", "Tom", "王小明", "", "李四"};

tag_ProviderContact Contact(int iId, const std::string& strName)
{
    tag_ProviderContact contact;
    contact.iId = iId;
    contact.strName = strName;
    contact.strKey = LocalizerKeyOf(strName);
    contact.llLastTime = FIRST_TIME + iId % 3 * 1000LL + iId;
    contact.iStatusId = FIRST_STATUS + iId;
    contact.bOnline = iId == 1 || iId == 5;
    return contact;
}

void Rename(CProviderDatabase& provider, int iId, const std::string& strName)
{
    provider.SetName(iId, strName, LocalizerKeyOf(strName));
}

// Allocates nothing itself.
int TellOf(CLocalizerLogic& logic, std::initializer_list<long long> ids)
{
    long long allIds[8] = {};
    std::copy(ids.begin(), ids.end(), allIds);
    logic.OnContactsTableChanged(static_cast<int>(ids.size()), allIds);
    return 0;
}

void InsertRenameAndRemove(CProviderDatabase& provider)
{
    provider.Put(Contact(6, "明7"));
    Rename(provider, 3, "Anna");
    provider.Remove(2);
    provider.Execute("update contacts set has_phone_number=1 where _id=4");
}

bool IsNone(const tag_ContactReg& reg)
{
    return reg == tag_ContactReg{};
}

// Without what a patch or a failed read of the status leaves to the next status notification.
tag_StoreImage WithoutOnline(tag_StoreImage image)
{
    for (tag_ContactsStruct& record : image.vRecords)
    {
        record.iFlags &= ~CONTACT_FLAG_ONLINE;
    }
    return image;
}

std::string Difference(const tag_StoreImage& store, const tag_StoreImage& fresh)
{
    return DifferenceOf(WithoutOnline(store), WithoutOnline(fresh));
}

} // namespace

const std::vector<tag_Change>& AllChanges()
{
    static const auto fnNothing = [](CProviderDatabase&) {};
    static const std::vector<tag_Change> vChanges = {
        {"FirstBuild", fnNothing, [](CLocalizerLogic& logic) { return logic.MemInit(false); }},
        {"Build", InsertRenameAndRemove,
         [](CLocalizerLogic& logic) { return logic.MemInit(true); }},
        {"Rebuild", InsertRenameAndRemove,
         [](CLocalizerLogic& logic)
         {
             logic.OnContactsTableChanged();
             return 0;
         }},
        {"Insert", [](CProviderDatabase& provider) { provider.Put(Contact(6, "明7")); },
         [](CLocalizerLogic& logic) { return TellOf(logic, {6}); }},
        {"Rename", [](CProviderDatabase& provider) { Rename(provider, 3, "Anna"); },
         [](CLocalizerLogic& logic) { return TellOf(logic, {3}); }},
        {"Remove", [](CProviderDatabase& provider) { provider.Remove(2); },
         [](CLocalizerLogic& logic) { return TellOf(logic, {2}); }},
        {"Renew",
         [](CProviderDatabase& provider)
         { provider.Execute("update contacts set has_phone_number=1 where _id=4"); },
         [](CLocalizerLogic& logic) { return TellOf(logic, {4}); }},
        {"Many", InsertRenameAndRemove,
         [](CLocalizerLogic& logic) {
             return TellOf(logic, {6, 3, 2, 4, 777});
         }},
        {"Status",
         [](CProviderDatabase& provider)
         {
             provider.Execute("update status_updates set status_update_data_id=1002 where "
                              "status_update_data_id=1001");
         },
         [](CLocalizerLogic& logic)
         {
             logic.OnStatusUpdatesTableChanged(0, nullptr);
             return 0;
         }},
        {"Time", [](CProviderDatabase& provider) { provider.SetLastTime(3, FIRST_TIME + 60'000); },
         [](CLocalizerLogic& logic)
         {
             logic.OnContactTimeChanged(3, FIRST_TIME + 60'000);
             return 0;
         }},
        {"Star", [](CProviderDatabase& provider) { provider.SetStarred(4, true); },
         [](CLocalizerLogic& logic)
         {
             logic.OnContactStarChanged(4, 1);
             return 0;
         }},
        {"SortType", fnNothing,
         [](CLocalizerLogic& logic)
         {
             logic.SetSortType(logic.OnGetSortType() == 0 ? 1 : 0);
             return 0;
         }},
    };
    return vChanges;
}

CStoreCase::CStoreCase(const tag_Change& change, int iSortType)
    : m_change(change), m_bBuilt(std::string("FirstBuild") != change.szName),
      m_iSortType(m_bBuilt ? iSortType : STORE_ORDER_NAME)
{
    m_directory.InstallPinyinTable();
    CProviderDatabase provider;
    CLocalizerLogic logic;
    logic.MemInit(true);
    int iId = 0;
    for (const char* szName : NAMES)
    {
        provider.Put(Contact(++iId, szName));
    }
    m_before = FreshBuild(m_directory.Root(), iSortType);
    change.fnChange(provider);
    for (const int iType : {0, 1})
    {
        m_aAfter[iType] = FreshBuild(m_directory.Root(), iType);
    }
    for (const tag_StoreImage* pImage : {&m_before, &m_aAfter[0]})
    {
        for (const tag_ContactsStruct& record : pImage->vRecords)
        {
            m_mapTexts.insert({record.iContactID, {record.szName, record.szLocalizerKey}});
        }
    }
    if (m_bBuilt)
    {
        m_strReg.assign(reinterpret_cast<const char*>(&m_before.reg), sizeof(m_before.reg));
        m_strRecords = BytesOf(m_before.vRecords);
        m_uLength = static_cast<size_t>(m_before.reg.iMemSize) * sizeof(tag_ContactsStruct);
    }
}

void CStoreCase::Write(const std::string& strReg, const std::string& strRecords, size_t uLength)
{
    if (strReg.empty())
    {
        fs::remove(CDataPaths::ContactReg());
        fs::remove(CDataPaths::ContactRecords());
        return;
    }
    CDataDirectory::WriteBytes(CDataPaths::ContactReg(), strReg);
    CDataDirectory::WriteBytes(CDataPaths::ContactRecords(), strRecords);
    fs::resize_file(CDataPaths::ContactRecords(), uLength);
}

void CStoreCase::Restore() const
{
    Write(m_strReg, m_strRecords, m_uLength);
    if (!m_bBuilt)
    {
        fs::remove(CDataPaths::PinyinMapping());
    }
}

tag_StoreImage CStoreCase::Present()
{
    const bool bBuilt =
        CDataDirectory::ReadBytes(CDataPaths::ContactReg()).size() == sizeof(tag_ContactReg);
    return bBuilt ? ReadStore() : tag_StoreImage{};
}

STORE_KIND CStoreCase::KindOf(const tag_StoreImage& image, std::string* pstrWhy) const
{
    if (IsNone(image.reg))
    {
        return KIND_NONE;
    }
    const int iSortType = image.reg.iSortType;
    if (iSortType != m_iSortType && std::string("SortType") != m_change.szName)
    {
        *pstrWhy = "sort type lost";
        return KIND_WRONG;
    }
    if (IsMarked(image.reg))
    {
        for (const tag_ContactsStruct& record : image.vRecords)
        {
            *pstrWhy = MixedContact(record.iContactID, record.szName, record.szLocalizerKey);
            if (!pstrWhy->empty())
            {
                return KIND_WRONG;
            }
        }
        return KIND_MARKED;
    }
    *pstrWhy = Difference(image, After(iSortType));
    if (pstrWhy->empty())
    {
        return KIND_AFTER;
    }
    if (m_bBuilt && Difference(image, m_before).empty())
    {
        return KIND_BEFORE;
    }
    *pstrWhy = "looks whole: " + *pstrWhy;
    return KIND_WRONG;
}

std::string CStoreCase::MixedContact(int iContactID, const wchar_t* szName,
                                     const wchar_t* szKey) const
{
    const auto range = m_mapTexts.equal_range(iContactID);
    const bool bKnown =
        std::any_of(range.first, range.second,
                    [&](const auto& entry) {
                        return (szName == nullptr || entry.second.first == szName) &&
                               entry.second.second == szKey;
                    });
    // A slot without a contact is nobody's.
    return iContactID == 0 || bKnown ? std::string() : "a contact beside another's name";
}

std::string CStoreCase::RepairFault() const
{
    const tag_StoreImage store = Present();
    if (IsMarked(store.reg) || IsNone(store.reg))
    {
        return "not repaired";
    }
    return DifferenceOf(store, After(store.reg.iSortType));
}
