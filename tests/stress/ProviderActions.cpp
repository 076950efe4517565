#include "tests/stress/ProviderActions.h"

#include "Common/DataPaths.h"
#include "Core/LocalizerLogic.h"
#include "LocalizerImpl/QVLocalizerManager.h"
#include "tests/Support/DataDirectory.h"
#include "tests/Support/StoreImage.h"
#include "tests/stress/Process.h"

#include <algorithm>
#include <iterator>
#include <sqlite3.h>

namespace
{

constexpr int MAX_CHANGED = 6;
constexpr int LONG_LIST = 201;
constexpr int FIRST_UNKNOWN_ID = 1'000'000;
constexpr int FIRST_STATUS_ID = 500'000;
constexpr long long FIRST_TIME = 1'600'000'000'000; // years ago: index character '5'

// What names are made of: characters of one and more readings, traditional ones, one without
// reading, letters, digits and signs. Short names of few parts make many equal ones.
constexpr const char* NAME_PARTS[] = {"张", "王", "李", "重", "单", "曾",  "張",   "龍",
                                      "安", "明", "三", "阿", "𠮷", "Tom", "zoe",  "A",
                                      "li", " ",  "7",  "#",  "é",  "〇",  "晓明", "O'N"};
constexpr const char* LISTS[] = {"", "1", "2", "1.2.3", "3.4", "5..7"};

} // namespace

const char* ActionName(ACTION_KIND eKind)
{
    constexpr const char* NAMES[] = {"contacts", "long list", "all",       "status",
                                     "time",     "star",      "sort type", "build"};
    static_assert(std::size(NAMES) == ACTION_KINDS, "a name for every kind");
    return NAMES[eKind];
}

CProviderActions::CProviderActions(unsigned int uSeed) : m_random(uSeed)
{
    Require(CDataDirectory::Exists(CDataPaths::PinyinMapping()) ||
                CQVLocalizerManager::InitMapFile() == 0,
            "no pinyin mapping could be made");
}

void CProviderActions::Fill(int iContacts)
{
    std::vector<tag_ProviderContact> vContacts;
    for (int iId = 1; iId <= iContacts; ++iId)
    {
        vContacts.push_back(AnyContact(iId));
    }
    m_database.PutAll(vContacts);
}

tag_Action CProviderActions::Change(ACTION_KIND eKind)
{
    tag_Action action;
    action.eKind = eKind;
    m_database.Execute("begin");
    switch (eKind)
    {
    case ACTION_CONTACTS:
    case ACTION_ALL:
    case ACTION_MANY:
        ChangeContacts(action.vIds);
        break;
    case ACTION_STATUS:
        for (int i = 1 + Pick(MAX_CHANGED); i > 0; --i)
        {
            m_database.SetOnline(FIRST_STATUS_ID + AnyVisible(), Pick(2) == 0);
        }
        break;
    case ACTION_TIME:
        action.vIds = {AnyVisible()};
        action.llValue = LatestTime() + 1000;
        m_database.SetLastTime(static_cast<int>(action.vIds[0]), action.llValue);
        break;
    case ACTION_STAR:
        action.vIds = {AnyVisible()};
        action.llValue = Pick(2);
        m_database.SetStarred(static_cast<int>(action.vIds[0]), action.llValue != 0);
        break;
    case ACTION_SORT_TYPE:
        action.llValue = CLocalizerLogic().OnGetSortType() == 0 ? 1 : 0;
        break;
    default: // nothing to change before a build
        break;
    }
    while (eKind == ACTION_MANY && action.vIds.size() < LONG_LIST)
    {
        action.vIds.push_back(FIRST_UNKNOWN_ID + static_cast<long long>(action.vIds.size()));
    }
    m_database.Execute("commit");
    return action;
}

ACTION_KIND CProviderActions::AnyKind()
{
    constexpr ACTION_KIND KINDS[] = {ACTION_CONTACTS, ACTION_CONTACTS, ACTION_CONTACTS,
                                     ACTION_CONTACTS, ACTION_STATUS,   ACTION_TIME,
                                     ACTION_TIME,     ACTION_STAR};
    return Pick(5) == 0 ? static_cast<ACTION_KIND>(Pick(ACTION_KINDS)) : AnyOf(KINDS);
}

void CProviderActions::Notify(CLocalizerLogic& logic, tag_Action action)
{
    switch (action.eKind)
    {
    case ACTION_CONTACTS:
    case ACTION_MANY:
        logic.OnContactsTableChanged(static_cast<int>(action.vIds.size()), action.vIds.data());
        break;
    case ACTION_STATUS:
        logic.OnStatusUpdatesTableChanged(0, nullptr);
        break;
    case ACTION_TIME:
        logic.OnContactTimeChanged(static_cast<long>(action.vIds[0]), action.llValue);
        break;
    case ACTION_STAR:
        logic.OnContactStarChanged(static_cast<long>(action.vIds[0]),
                                   static_cast<int>(action.llValue));
        break;
    case ACTION_SORT_TYPE:
        logic.SetSortType(static_cast<int>(action.llValue));
        break;
    case ACTION_BUILD:
        while (logic.MemInit(true) != 0)
        {
        }
        break;
    case ACTION_ALL:
    case ACTION_KINDS:
        logic.OnContactsTableChanged();
        break;
    }
}

// The number that the query gives.
int CProviderActions::Ask(const std::string& strSql)
{
    sqlite3_stmt* pStatement = nullptr;
    sqlite3_prepare_v2(m_database.Handle(), strSql.c_str(), -1, &pStatement, nullptr);
    Require(sqlite3_step(pStatement) == SQLITE_ROW, "no row: " + strSql);
    const int iAnswer = sqlite3_column_int(pStatement, 0);
    sqlite3_finalize(pStatement);
    return iAnswer;
}

// At least FIRST_TIME, so that the difference is a small number.
long long CProviderActions::LatestTime()
{
    const std::string strFirst = std::to_string(FIRST_TIME);
    return FIRST_TIME + Ask("select max(max(last_time_contacted)," + strFirst + ")-" + strFirst +
                            " from contacts");
}

int CProviderActions::AnyVisible()
{
    return Ask("select _id from visible_contacts order by _id limit 1 offset " +
               std::to_string(Pick(VisibleContacts())));
}

std::string CProviderActions::AnyName()
{
    std::string strName;
    for (int i = Pick(4); i > 0; --i)
    {
        strName += AnyOf(NAME_PARTS);
    }
    return strName;
}

tag_ProviderContact CProviderActions::AnyContact(int iId)
{
    tag_ProviderContact contact;
    contact.iId = iId;
    contact.strName = AnyName();
    contact.strKey = LocalizerKeyOf(contact.strName);
    contact.strGroups = AnyOf(LISTS);
    contact.strAccounts = AnyOf(LISTS);
    contact.llLastTime = Pick(3) == 0 ? 0 : FIRST_TIME - Pick(1'000'000'000);
    contact.iStatusId = FIRST_STATUS_ID + iId;
    contact.bPhone = Pick(2) == 0;
    contact.bSecret = Pick(8) == 0;
    contact.bMail = Pick(3) == 0;
    contact.bStarred = Pick(5) == 0;
    return contact;
}

void CProviderActions::ChangeContact(int iId)
{
    const std::string strId = std::to_string(iId);
    const int iChange = Pick(6);
    if (Ask("select count(*) from contacts where _id=" + strId) == 0)
    {
        m_database.Put(AnyContact(iId));
    }
    else if (iChange == 0)
    {
        m_database.Remove(iId);
    }
    else if (iChange == 1)
    {
        m_database.SetVisible(iId,
                              Ask("select count(*) from visible_contacts where _id=" + strId) == 0);
    }
    else if (iChange < 4)
    {
        const std::string strName = AnyName();
        m_database.SetName(iId, strName, LocalizerKeyOf(strName));
    }
    else
    {
        m_database.Execute("update contacts set has_phone_number=1-has_phone_number where _id=" +
                           strId + "; update localizer set group_id='" + AnyOf(LISTS) +
                           "', hasMail=1-hasMail where contact_id=" + strId);
    }
}

void CProviderActions::ChangeContacts(std::vector<long long>& vIds)
{
    const int iHighest = Ask("select max(_id) from contacts") + 2;
    for (int i = 1 + Pick(MAX_CHANGED); i > 0; --i)
    {
        const int iId = 1 + Pick(iHighest);
        if (std::find(vIds.begin(), vIds.end(), iId) == vIds.end())
        {
            vIds.push_back(iId);
            ChangeContact(iId);
        }
    }
}
