#include "tests/faults/StoreCase.h"

#include "Filter/Filter.h"
#include "Filter/FilterChain.h"
#include "tools/Utf8Text.h"

#include <cwchar>
#include <filesystem>

namespace fs = std::filesystem;

namespace
{

constexpr long long FIRST_TIME = 1'600'000'000'000;
constexpr int FIRST_STATUS = 1000;
constexpr int SINGLE_CHANGES = 4; // at the start of the list
// A patch and a failed read of the status leave the others to the next status notification.
constexpr uint32_t DURABLE = ~CONTACT_FLAG_ONLINE;
constexpr const char* NAMES[] = {"张安", "Tom", "王小明", "", "李四"};

tag_DatabaseContact Contact(int iId, const std::string& strName)
{
    tag_DatabaseContact contact = {iId, strName, LocalizerKeyOf(strName)};
    contact.llLastTimeContacted = FIRST_TIME + iId % 3 * 1000LL + iId;
    contact.llStatusUpdateID = FIRST_STATUS + iId;
    contact.bPhone = iId < 3;
    contact.strStatus = iId == 1 || iId == 5 ? "online" : "";
    return contact;
}

// The changes of single contacts, one after the other.
void ChangeMuch(CProviderDatabase& provider)
{
    std::for_each(AllChanges().begin(), AllChanges().begin() + SINGLE_CHANGES,
                  [&provider](const auto& change) { change.pfnChange(provider); });
}

template <long long... IDS>
void Tell(CLocalizerLogic& logic, tag_Answer& /*answer*/)
{
    long long allIds[] = {IDS...};
    logic.OnContactsTableChanged(sizeof...(IDS), allIds);
}

void SearchWithin(CLocalizerLogic& logic, tag_Answer& answer)
{
    tag_LocalizerDetail allDetails[2] = {};
    allDetails[0].szLocalizerKey[0] = allDetails[1].szLocalizerKey[1] = LOC_ALPHA_BASE + 3;
    tag_LocalizerResult last = {2, allDetails};
    Search(logic, answer, L"d", IME_SEARCH_WORD, 0, &last);
}

void Convert(CLocalizerLogic& logic, tag_Answer& answer)
{
    wchar_t szName[] = L"张 Tom 7";
    answer.iRet = logic.GetLocalizer(szName, answer.szText);
}

void ConvertBatch(CLocalizerLogic& logic, tag_Answer& answer)
{
    tag_ContactsStruct record = {};
    std::wcscpy(record.szName, L"李Lee");
    tag_ContactsInfo info = {1, &record};
    answer.iRet = logic.GetLocalizerBatch(&info);
    std::copy_n(record.szLocalizerKey, CONTACT_MAX_KEY, answer.szText);
}

void Pick(CLocalizerLogic& logic, tag_Answer& answer)
{
    wchar_t szInput[16] = L"zhang";
    wchar_t szWord[] = L"张";
    answer.iRet = logic.GetLocalizerString(szInput, 5, szWord, answer.szText);
}

void ConvertByMapping(CLocalizerLogic& logic, tag_Answer& answer)
{
    const long hMap = logic.CreatePinYinFileMapping();
    wchar_t szName[] = L"重庆";
    answer.iRet = hMap == -1 ? -1 : logic.GetLocalizerString(hMap, szName, answer.szText);
    logic.ReleasePinYinFileMapping(hMap);
}

} // namespace

void Search(CLocalizerLogic& logic, tag_Answer& answer, const wchar_t* szTyped,
            IME_SEARCH_TYPE eType, int iFilter, tag_LocalizerResult* pLast)
{
    std::wstring strInput = szTyped;
    QVLong32 lId = 3;
    CFilterChain* pChain = nullptr;
    answer.iRet = logic.CreateFilterChain(&iFilter, &lId, iFilter == 0 ? 0 : 1, &pChain);
    if (answer.iRet == 0)
    {
        answer.iRet = logic.Search(pLast, strInput.data(), eType, pChain, 0, &answer.pResult,
                                   &answer.lMask, answer.szText);
    }
    delete pChain;
}

const std::vector<tag_Operation>& AllChanges()
{
    static const std::vector<tag_Operation> vChanges = {
        {"Insert", Tell<6>, [](auto& provider) { provider.Put(Contact(6, "明7")); }},
        {"Rename", Tell<3>,
         [](auto& provider) { provider.SetName(3, "Anna", LocalizerKeyOf("Anna")); }},
        {"Remove", Tell<2>, [](auto& provider) { provider.Remove(2); }},
        {"Renew", Tell<4>,
         [](auto& provider)
         { provider.Execute("update contacts set has_phone_number=1 where _id=4"); }},
        {"Many", Tell<6, 3, 2, 4, 777>, ChangeMuch},
        {"FirstBuild", [](auto& logic, auto& answer) { answer.iRet = logic.MemInit(false); }},
        {"Build", [](auto& logic, auto& answer) { answer.iRet = logic.MemInit(true); }, ChangeMuch},
        {"Rebuild", [](auto& logic, auto&) { logic.OnContactsTableChanged(); }, ChangeMuch},
        {"Status", [](auto& logic, auto&) { logic.OnStatusUpdatesTableChanged(0, nullptr); },
         [](auto& provider)
         {
             provider.Execute("update status_updates set status_update_data_id=1002 where "
                              "status_update_data_id=1001");
         }},
        {"Time", [](auto& logic, auto&) { logic.OnContactTimeChanged(3, FIRST_TIME + 60'000); },
         [](auto& provider) { provider.SetLastTime(3, FIRST_TIME + 60'000); }},
        {"Star", [](auto& logic, auto&) { logic.OnContactStarChanged(4, 1); },
         [](auto& provider) { provider.SetStarred(4, true); }},
        {"SortType",
         [](auto& logic, auto&) { logic.SetSortType(logic.OnGetSortType() == 0 ? 1 : 0); }},
    };
    return vChanges;
}

const std::vector<tag_Operation>& AllReadings()
{
    static const std::vector<tag_Operation> vReadings = {
        {"Everybody",
         [](auto& logic, auto& answer) { Search(logic, answer, L"", IME_SEARCH_WORD); }},
        {"Letters",
         [](auto& logic, auto& answer) { Search(logic, answer, L"za", IME_SEARCH_WORD); }},
        {"Digits", [](auto& logic, auto& answer)
         { Search(logic, answer, L"9", IME_SEARCH_NUM, FILTER_PHONE); }},
        {"LoggingFilter", [](auto& logic, auto& answer)
         { Search(logic, answer, L"", IME_SEARCH_NUM, FILTER_ACCOUNT_EXPAND); }},
        {"Special",
         [](auto& logic, auto& answer) { Search(logic, answer, L"z", IME_SEARCH_SPECIAL); }},
        {"Narrowed", SearchWithin},
        {"Keys", Convert},
        {"KeyBatch", ConvertBatch},
        {"Picked", Pick},
        {"Mapping", ConvertByMapping},
        {"Start", [](auto& logic, auto& answer) { answer.iRet = logic.MemInit(false); }},
    };
    return vReadings;
}

std::string TextOf(CLocalizerLogic& logic, const tag_Answer& answer)
{
    std::string strText = std::to_string(answer.iRet);
    if (answer.pResult == nullptr)
    {
        return answer.iRet == 0 ? strText + Utf8Text(answer.szText) : strText;
    }
    for (int i = 0; i < answer.pResult->iResultNum; ++i)
    {
        strText += " " + std::to_string(answer.pResult->pDetail[i].iContactID);
    }
    const bool bNobody = answer.pResult->iResultNum == 0;
    logic.FreeSearchResult(answer.pResult);
    return bNobody ? "0 nobody" : strText + " keys " + std::to_string(answer.lMask);
}

CStoreCase::CStoreCase(const tag_Operation& change, int iSortType)
    : m_strChange(change.szName), m_iSortType(Is("FirstBuild") ? STORE_ORDER_NAME : iSortType)
{
    m_directory.InstallPinyinTable();
    CProviderDatabase provider;
    CLocalizerLogic().MemInit(true);
    int iId = 0;
    for (const char* szName : NAMES)
    {
        provider.Put(Contact(++iId, szName));
    }
    m_before = FreshBuild(m_directory.Root(), iSortType);
    change.pfnChange(provider);
    m_aAfter[0] = FreshBuild(m_directory.Root(), 0);
    m_aAfter[1] = FreshBuild(m_directory.Root(), 1);
    for (const tag_StoreImage* pImage : {&m_before, &m_aAfter[0]})
    {
        for (const tag_ContactsStruct& record : pImage->vRecords)
        {
            m_mapTexts.insert({record.iContactID, {record.szName, record.szLocalizerKey}});
        }
    }
}

void CStoreCase::Write(const tag_StoreFiles& files)
{
    const auto PutFile = [](const char* szPath, const std::string& strBytes)
    {
        fs::remove(szPath);
        if (!strBytes.empty())
        {
            CDataDirectory::WriteBytes(szPath, strBytes);
        }
    };
    PutFile(CDataPaths::ContactReg(), files.strReg);
    PutFile(CDataPaths::ContactRecords(), files.strRecords);
}

void CStoreCase::Restore() const
{
    if (Is("FirstBuild"))
    {
        Write({});
        fs::remove(CDataPaths::PinyinMapping());
        return;
    }
    Write({"", BytesOf(m_before.vRecords)});
    SetReg(m_before.reg);
    fs::resize_file(CDataPaths::ContactRecords(),
                    static_cast<size_t>(m_before.reg.iMemSize) * sizeof(tag_ContactsStruct));
}

STORE_KIND CStoreCase::KindOf(tag_StoreImage image, std::string* pstrWhy) const
{
    if (image.reg == tag_ContactReg{})
    {
        return KIND_NONE;
    }
    if (image.reg.iSortType != m_iSortType && !Is("SortType"))
    {
        *pstrWhy = "sort type lost";
        return KIND_WRONG;
    }
    if (IsMarked(image.reg))
    {
        for (const tag_ContactsStruct& record : image.vRecords)
        {
            *pstrWhy += MixedContact(record.iContactID, record.szName, record.szLocalizerKey);
        }
        return pstrWhy->empty() ? KIND_MARKED : KIND_WRONG;
    }
    const tag_StoreImage& after = After(image.reg.iSortType);
    if (!DifferenceOf(image, after, DURABLE).empty() && !Is("FirstBuild") &&
        DifferenceOf(image, m_before, DURABLE).empty())
    {
        return KIND_BEFORE;
    }
    // In name order a time and its count change one after the other in a store that stays whole.
    for (size_t i = 0; Is("Time") && i < std::min(image.vRecords.size(), after.vRecords.size());
         ++i)
    {
        image.vRecords[i].llLastTimeContacted = after.vRecords[i].llLastTimeContacted;
        image.vRecords[i].iTimesContacted = after.vRecords[i].iTimesContacted;
    }
    *pstrWhy = DifferenceOf(image, after, DURABLE);
    return pstrWhy->empty() ? KIND_AFTER : KIND_WRONG;
}

// A slot without a contact is nobody's.
std::string CStoreCase::MixedContact(int iContactID, const wchar_t* szName,
                                     const wchar_t* szKey) const
{
    bool bKnown = iContactID == 0;
    for (auto [it, end] = m_mapTexts.equal_range(iContactID); it != end; ++it)
    {
        const auto& [strName, strKey] = it->second;
        bKnown |= (szName == nullptr || strName == szName) && strKey == szKey;
    }
    return bKnown ? "" : "a contact beside another's name";
}

std::string CStoreCase::RepairFault() const
{
    const tag_StoreImage store = ReadStore();
    return IsMarked(store.reg) ? "not repaired" : DifferenceOf(store, After(store.reg.iSortType));
}
