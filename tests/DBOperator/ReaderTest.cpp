// Reading a real provider database: what its rows become, and what the reader makes of databases
// that are missing, damaged, locked or changed meanwhile.

#include "Common/DataPaths.h"
#include "DBOperator/SQLiteOperator.h"
#include "DBOperator/SqlIdList.h"
#include "DBOperator/StatusIndex.h"
#include "tests/Support/DataDirectory.h"
#include "tests/Support/LogCapture.h"
#include "tests/Support/MemoryFailure.h"
#include "tests/Support/ProviderDatabase.h"

#include <gtest/gtest.h>
#include <sqlite3.h>

#include <algorithm>
#include <climits>
#include <cstring>
#include <filesystem>
#include <numeric>
#include <tuple>

namespace
{

namespace fs = std::filesystem;

using Ids = std::vector<int>;
using Groups = std::vector<QVLong32>;

const std::string READER = "QV_Contacts>>QV_ContactsLocalize_SO>>";
const std::string COUNT_STEP = " QV_Contacts >>QV_ContactsLocalize_SO>> ReadAllLocalizer select "
                               "contacts count ";
const std::string SQLSTAT_4 = "QV_Contacts>>C>>SQLiteOperator>> ReadAllLocalizer>> sqlstat_4 = ";
const std::string SQLSTAT_5 = "QV_Contacts>>C>>SQLiteOperator>> ReadAllLocalizer>> sqlstat_5 = ";

// 1, 2 and so on up to iLast, and their text.
Groups UpTo(int iLast)
{
    Groups vIds(static_cast<size_t>(iLast));
    std::iota(vIds.begin(), vIds.end(), 1);
    return vIds;
}
std::string IdText(int iLast)
{
    return iLast == 1 ? "1" : IdText(iLast - 1) + "." + std::to_string(iLast);
}

// What a read leaves, released with the object.
struct tag_ReadSet : tag_ContactsInfo
{
    tag_ReadSet() : tag_ContactsInfo{0, nullptr} {}
    ~tag_ReadSet() { delete[] pContacts; }
    tag_ReadSet(const tag_ReadSet&) = delete;
    tag_ReadSet& operator=(const tag_ReadSet&) = delete;

    Ids IdsRead() const
    {
        Ids vIds(static_cast<size_t>(RecordNum));
        std::transform(pContacts, pContacts + RecordNum, vIds.begin(),
                       [](const auto& record) { return record.iContactID; });
        return vIds;
    }
};

// The record of a contact whose texts are read as these.
tag_ContactsStruct RecordOf(const tag_ProviderContact& contact, const std::wstring& strName,
                            const std::wstring& strKey, const Groups& vGroups,
                            const Groups& vAccounts)
{
    tag_ContactsStruct record = {};
    record.iContactID = contact.iId;
    record.iFlags =
        (contact.bStarred ? CONTACT_FLAG_STARRED : 0) | (contact.bPhone ? CONTACT_FLAG_PHONE : 0) |
        (contact.bSecret ? CONTACT_FLAG_SECRET : 0) | (contact.bMail ? CONTACT_FLAG_MAIL : 0) |
        (contact.bAddress ? CONTACT_FLAG_ADDRESS : 0);
    record.llLastTimeContacted = contact.llLastTime;
    record.iTimesContacted = contact.iTimes;
    record.iStatusUpdateID = contact.iStatusId;
    std::copy(strName.begin(), strName.end(), record.szName);
    std::copy(strKey.begin(), strKey.end(), record.szLocalizerKey);
    std::copy(vGroups.begin(), vGroups.end(), record.lGroupID);
    std::copy(vAccounts.begin(), vAccounts.end(), record.lAccountID);
    return record;
}

bool IsSame(const tag_ContactsStruct& a, const tag_ContactsStruct& b)
{
    return std::memcmp(&a, &b, sizeof(a)) == 0;
}

// The place of a virtual operation, as it stands in a pointer to it.
template <typename T>
size_t SlotOf(T pfnOperation)
{
    size_t uOffset = 0;
    std::memcpy(&uOffset, &pfnOperation, sizeof(uOffset));
    return uOffset / sizeof(void*);
}

std::string ListText(std::vector<long long> vIds)
{
    return CSqlIdList(static_cast<long>(vIds.size()), vIds.data()).Text();
}

sqlite3* g_pReaderDB = nullptr;

// Gives the reader's own connection to the tests.
int CatchConnection(sqlite3* pDB, char** /*pszError*/, const sqlite3_api_routines* /*pApi*/)
{
    g_pReaderDB = pDB;
    return SQLITE_OK;
}

// SQLite's memory, of which only so many allocations are granted. SQLite is told before it starts,
// and to ask for each allocation instead of keeping small ones at hand.
struct tag_SqliteMemory
{
    tag_SqliteMemory()
    {
        sqlite3_config(SQLITE_CONFIG_GETMALLOC, &s_system);
        sqlite3_mem_methods methods = s_system;
        methods.xMalloc = [](int iSize) { return IsRefused() ? nullptr : s_system.xMalloc(iSize); };
        methods.xRealloc = [](void* pMemory, int iSize)
        { return IsRefused() ? nullptr : s_system.xRealloc(pMemory, iSize); };
        sqlite3_config(SQLITE_CONFIG_MALLOC, &methods);
        sqlite3_config(SQLITE_CONFIG_LOOKASIDE, 0, 0);
    }
    static bool IsRefused() { return s_iGranted == 0 || --s_iGranted == 0; }

    static inline sqlite3_mem_methods s_system = {};
    static inline int s_iGranted = INT_MAX;
} g_sqliteMemory;

// A reader on an empty provider database in a directory of its own.
class Reader : public testing::Test
{
protected:
    int ReadAll(tag_ContactsInfo& set) { return m_reader.ReadAllLocalizer(&set, 0, nullptr); }
    int Count() { return m_reader.GetContactsCount(&m_iCount); }
    int ReadOnline(tag_ContactsInfo& set)
    {
        return m_reader.ReadAllSmsOnlineStatus(&set, 0, nullptr);
    }
    Lines Errors()
    {
        Lines vErrors = m_log.Texts(ERROR_LINE);
        m_log.Clear();
        return vErrors;
    }

    CDataDirectory m_directory;
    CProviderDatabase m_provider;
    CLogCapture m_log;
    CSQLiteOperator m_reader;
    int m_iCount = 42;
};

} // namespace

TEST(DBOperatorInterface, KeepsTheOrderOfItsSlots)
{
    EXPECT_EQ(2U, SlotOf(&CDBOperator::GetContactsCount));
    EXPECT_EQ(3U, SlotOf(&CDBOperator::ReadAllLocalizer));
    EXPECT_EQ(4U, SlotOf(&CDBOperator::ReadContactsByID));
    EXPECT_EQ(5U, SlotOf(&CDBOperator::ReadAllSmsOnlineStatus));
}

TEST(IdTexts, HoldWhatFits)
{
    const std::tuple<const char*, int, Groups> ROWS[] = {
        // text, places, what is stored: -9 where nothing is
        {nullptr, 4, {-9, -9, -9, -9}},
        {"3.12.40", 4, {3, 12, 40, -9}},
        {"5..7", 4, {5, 0, 7, -9}},
        {"7.x.9", 4, {7, -9, -9, -9}},
        {"-7", 4, {-9, -9, -9, -9}},
        {"1.2.3", 2, {1, 2, -9, -9}},
        {"1.2.3.4", 2, {1, 2, -9, -9}},
        {"1", 0, {-9, -9, -9, -9}},
        {"2147483648.4294967303", 4, {-2147483647 - 1, 7, -9, -9}}};
    for (const auto& [szText, iMax, vStored] : ROWS)
    {
        Groups vIds(4, -9);
        CSQLiteOperator().ParseIDString(szText, vIds.data(), iMax);
        EXPECT_EQ(vStored, vIds) << (szText == nullptr ? "null" : szText);
    }
    EXPECT_EQ(" in(7)", ListText({7}));
    EXPECT_EQ(" in(1,-2147483648,-1,5)", ListText({1, 0x80000000LL, -1, 0x100000005LL}));
    // " in(" and 163 ids of ten digits are 1,796 characters: one more id begins, whatever its
    // length, and the list ends.
    std::vector<long long> vIds(163, 1234567890);
    ASSERT_EQ(1796U + 1, ListText(vIds).size());
    vIds.push_back(-2147483648LL);
    EXPECT_TRUE(CSqlIdList::CanListAll(164, vIds.data()));
    const std::string strFull = ListText(vIds);
    EXPECT_EQ(1796U + 12 + 1, strFull.size());
    vIds.push_back(1);
    EXPECT_FALSE(CSqlIdList::CanListAll(165, vIds.data()));
    EXPECT_EQ(strFull, ListText(vIds));
}

// The rows of a database and their records; those of a single contact may have one group more.
TEST_F(Reader, MakesRecordsOfRows)
{
    const std::wstring strLetters(30, L'x');
    const std::wstring strZhang(10, L'\u5F20');
    const std::string strZhangBytes = "张张张张张张张张张张张张张张张张";
    tag_ProviderContact full = {-4, "安", "k", IdText(101), "6", 1'700'000'000'123, 2, 8};
    full.bSecret = full.bMail = full.bPhone = true;
    Groups vFullGroups = UpTo(99);
    vFullGroups.push_back(SECRET_GROUP_ID);
    tag_ProviderContact secret = {1, "", "", "7.x.9", IdText(21)};
    secret.bSecret = secret.bStarred = secret.bAddress = true;
    const std::tuple<tag_ProviderContact, tag_ContactsStruct> ROWS[] = {
        {full, RecordOf(full, L"安", L"k", vFullGroups, {6})},
        {secret, RecordOf(secret, L"", L"", {7, SECRET_GROUP_ID}, UpTo(20))},
        {{2, std::string(40, 'x'), std::string(40, 'x')},
         RecordOf({2}, strLetters, strLetters.substr(0, 10), {}, {})},
        {{3, strZhangBytes, strZhangBytes}, RecordOf({3}, strZhang, strZhang, {}, {})},
        // The last character would end behind the limit.
        {{4, "x" + strZhangBytes, "x" + strZhangBytes},
         RecordOf({4}, L"x" + strZhang.substr(1), L"x" + strZhang.substr(1), {}, {})},
        // Not UTF-8 from some byte on.
        {{5, "ab\xF0\x9F\x98\x80zz", std::string("ab\0cd", 5)},
         RecordOf({5}, L"ab", L"ab", {}, {})},
    };
    for (const auto& [contact, expected] : ROWS)
    {
        m_provider.Put(contact);
    }
    tag_ReadSet set;
    ASSERT_EQ(0, ReadAll(set));
    ASSERT_EQ(6, set.RecordNum);
    for (int i = 0; i < 6; ++i)
    {
        tag_ContactsStruct expected = std::get<1>(ROWS[i]);
        EXPECT_TRUE(IsSame(expected, set.pContacts[i])) << i;
        tag_ContactsStruct record = {};
        expected.lGroupID[99] = i == 0 ? 100 : 0;
        record.iStatusUpdateID = expected.iStatusUpdateID = 77; // not read
        int iFound = 5;
        EXPECT_EQ(0, m_reader.ReadContactsByID(expected.iContactID, &record, iFound));
        EXPECT_EQ(1, iFound);
        EXPECT_TRUE(IsSame(expected, record)) << i;
    }
    EXPECT_TRUE(
        m_log.Has(DEBUG_LINE, READER + " CSQLiteOperator ReadContactsByID iContactID = -4\n"));
    // Found tells of the name row; a hidden contact is read alone.
    m_provider.Execute("delete from contacts where _id=1; delete from localizer where "
                       "contact_id=2; delete from visible_contacts");
    const int FOUND[][3] = {{1, 1, 0}, {2, 0, 2}, {3, 1, 3}, {99, 0, 0}};
    for (const auto& [iId, iExpected, iFilledId] : FOUND)
    {
        tag_ContactsStruct record = {};
        int iFound = -1;
        EXPECT_EQ(0, m_reader.ReadContactsByID(iId, &record, iFound));
        EXPECT_EQ(iExpected, iFound) << iId;
        EXPECT_EQ(iFilledId, record.iContactID) << iId;
    }
}

TEST_F(Reader, ReadsTheListedVisibleContactsOnly)
{
    m_provider.PutAll({{1}, {2}, {3}, {4}, {5}});
    m_provider.SetVisible(4, false);
    std::vector<long long> vIds = {5, 4, 2, 99};
    vIds.resize(201);
    const std::pair<long, Ids> COUNTS[] = {
        {200, {2, 5}}, {201, {1, 2, 3, 5}}, {-1, {1, 2, 3, 5}}, {1, {5}}};
    for (const auto& [lCount, vRead] : COUNTS)
    {
        m_log.Clear();
        tag_ReadSet set;
        ASSERT_EQ(0, m_reader.ReadAllLocalizer(&set, lCount, vIds.data()));
        EXPECT_EQ(vRead, set.IdsRead()) << lCount;
    }
    const std::string strVisible =
        "contacts where cast(exists(select _id from visible_contacts where "
        "contacts._id = visible_contacts._id ) as integer)=1";
    EXPECT_EQ(m_log.Texts(DEBUG_LINE),
              (Lines{READER + "SQLiteOperator>> ReadAllLocalizer begin",
                     READER +
                         "SQLiteOperator>> ReadAllLocalizer>> sqlstat_3 = select count(*) "
                         "from " +
                         strVisible + " and _id  in(5)\n",
                     SQLSTAT_4 +
                         "select _id,times_contacted,starred,has_phone_number,"
                         "last_time_contacted,single_is_secret,photo_file_id,status_update_id  "
                         "from " +
                         strVisible + "  and _id  in(5)\n",
                     SQLSTAT_5 + "select contact_id,display_name,localizerkey,group_id,account_id,"
                                 "hasMail,hasAddress from localizer where contact_id  in(5)\n"}));
}

TEST(StatusIndex, FindsTheSameWithoutItsTable)
{
    std::vector<tag_ContactsStruct> vRecords(256);
    for (int i = 0; i < 256; ++i)
    {
        vRecords[static_cast<size_t>(i)].iStatusUpdateID = i * 7 - 500;
    }
    const CStatusIndex withTable(vRecords.data(), 256);
    const CMemoryFailure failure(0);
    const CStatusIndex withoutTable(vRecords.data(), 256);
    for (int iStatusId = -600; iStatusId < 1500; ++iStatusId)
    {
        EXPECT_EQ(withTable.First(iStatusId), withoutTable.First(iStatusId)) << iStatusId;
    }
}

// With its table and, without memory, without it.
TEST_F(Reader, MarksTheFirstRecordOfEachOnlineStatus)
{
    m_provider.Execute("insert into status_updates values(-5,'online'),(0,'online'),(7,'away'),"
                       "(8,null),(9,'online'),(11,'online'),(12,'Online')");
    const std::string strFound = "CSQLiteOperator:Find one contact is sms online:statusid:";
    std::vector<tag_ContactsStruct> vRecords;
    for (const int iStatusId : {7, 9, 0, 8, 9, 0, -5, 12})
    {
        vRecords.push_back({});
        vRecords.back().iStatusUpdateID = iStatusId;
        vRecords.back().iFlags = CONTACT_FLAG_ONLINE;
    }
    tag_ContactsInfo set = {8, vRecords.data()};
    for (const int iGranted : {1000, 0})
    {
        EXPECT_EQ(0, Count()); // opens the database
        m_log.Clear();
        const CMemoryFailure failure(iGranted);
        EXPECT_EQ(0, ReadOnline(set)) << iGranted;
        for (size_t i = 0; i < 8; ++i)
        {
            EXPECT_EQ(i == 1 || i == 2 || i == 6 ? CONTACT_FLAG_ONLINE : 0, vRecords[i].iFlags);
        }
        EXPECT_EQ(m_log.Texts(DEBUG_LINE),
                  (Lines{strFound + "-5\n", strFound + "0\n", strFound + "9\n"}));
    }
    m_provider.Put({1});
    const CMemoryFailure failure(0);
    EXPECT_EQ(-1, ReadAll(set));
    EXPECT_EQ(Errors(), Lines{READER + "ReadAllLocalizer  NEW MEM ERR!!!!!!"});
}

// A refused allocation must not pass for an empty text: group ids that are numbers become text only
// when they are asked for.
TEST_F(Reader, FailsOrIsRightWithoutSqlitesMemory)
{
    m_provider.PutAll({{1, "a", "", "1.2"}, {2, "b", "", "7"}});
    m_provider.Execute("create table t as select * from localizer; drop table localizer;"
                       "create table localizer(contact_id, display_name, localizerkey, group_id "
                       "integer, account_id, hasMail, hasAddress);"
                       "insert into localizer select * from t");
    int iFailed = 0;
    for (bool bRanOut = true; bRanOut; ++iFailed)
    {
        CSQLiteOperator reader;
        tag_ReadSet set;
        tag_ContactsStruct single = {};
        int iFound = 0;
        tag_SqliteMemory::s_iGranted = iFailed + 1;
        const int iAll = reader.ReadAllLocalizer(&set, 0, nullptr);
        const int iSingle = iAll == 0 ? reader.ReadContactsByID(2, &single, iFound) : -1;
        bRanOut = tag_SqliteMemory::s_iGranted == 0;
        tag_SqliteMemory::s_iGranted = INT_MAX;
        EXPECT_TRUE(iAll != 0 || set.pContacts[1].lGroupID[0] == 7) << iFailed;
        EXPECT_TRUE(iSingle != 0 || iFound == 0 || single.lGroupID[0] == 7) << iFailed;
    }
    EXPECT_GT(iFailed, 50) << "SQLite asks for each allocation";
}

TEST_F(Reader, FailsOnWhatIsNoProviderDatabase)
{
    tag_ReadSet set;
    tag_ContactsStruct record = {};
    fs::remove(CDataPaths::Database());
    EXPECT_EQ(-1, ReadAll(set));
    EXPECT_EQ(-1, Count());
    EXPECT_EQ(-1, m_reader.ReadContactsByID(1, &record, m_iCount));
    EXPECT_EQ(-1, ReadOnline(set));
    EXPECT_EQ(Errors(), Lines(4, READER + "CSQLiteOperator  open iRetCode = 14"));
    EXPECT_FALSE(fs::exists(CDataPaths::Database()));

    CDataDirectory::WriteBytes(CDataPaths::Database(), std::string(5000, 'x'));
    EXPECT_EQ(-1, ReadAll(set));
    EXPECT_EQ(-1, Count());
    EXPECT_EQ(-1, ReadOnline(set));
    EXPECT_EQ(Errors(), (Lines{COUNT_STEP + "sqlite3_prepare ERROR result=26",
                               " " + READER + " select contacts count ERROR result=26",
                               " select contacts count ERROR result=26"}));
    EXPECT_EQ(42, m_iCount);
    EXPECT_EQ(nullptr, set.pContacts);

    fs::remove(CDataPaths::Database());
    CProviderDatabase provider;
    provider.PutAll({{1}, {2}});
    provider.Execute("alter table localizer drop column hasMail");
    CSQLiteOperator reader;
    EXPECT_EQ(-1, reader.ReadAllLocalizer(&set, 0, nullptr));
    EXPECT_EQ(2, set.RecordNum);
    provider.Execute("alter table contacts drop column photo_file_id");
    tag_ReadSet another;
    EXPECT_EQ(-1, CSQLiteOperator().ReadAllLocalizer(&another, 0, nullptr));
    EXPECT_EQ(Errors(), Lines{" " + READER + " select from contacts ERROR result=1"});
}

TEST_F(Reader, FailsWithoutContactsGoneSinceTheCountAndLeavesNewOnesOut)
{
    m_provider.PutAll({{1, "a"}, {2, "b"}, {4, "d"}});
    bool bRemoves = true;
    m_log.AtEachLine(
        [&](const std::string& strText)
        {
            if (strText.find(SQLSTAT_4) == 0)
            {
                bRemoves ? m_provider.Remove(2) : m_provider.Put({3, "c"});
            }
        });
    tag_ReadSet set;
    EXPECT_EQ(-1, ReadAll(set));
    EXPECT_EQ((Ids{1, 4, 0}), set.IdsRead());
    EXPECT_STREQ(L"d", set.pContacts[1].szName);
    EXPECT_EQ(Errors(),
              Lines{READER + "SQLiteOperator>>ReadAllLocalizer: iIndex < pRecord->RecordNum\n"});
    bRemoves = false;
    tag_ReadSet later;
    EXPECT_EQ(0, ReadAll(later));
    EXPECT_EQ((Ids{1, 3}), later.IdsRead());
    EXPECT_EQ(Errors(),
              (Lines{" " + READER + " select from contacts sqlite3_step ERROR result=100",
                     READER + " SQLiteOperator>>ReadAllLocalizer: sqlite3_step  error from "
                              "localizer"}));
}

// A fresh connection must read the tables' definitions first, and the prepare is busy; one that
// knows them meets the lock in its first step.
TEST_F(Reader, TriesALockedDatabaseForAWhile)
{
    const auto fnRepeat = [](int iTimes, const std::string& strLine, const std::string& strLast)
    {
        Lines vLines(static_cast<size_t>(iTimes), strLine);
        vLines.push_back(strLast);
        return vLines;
    };
    tag_ReadSet set;
    m_provider.Put({1});
    m_provider.LockExclusive();
    EXPECT_EQ(-1, ReadAll(set));
    EXPECT_EQ(Errors(), fnRepeat(4, READER + " SQLITE_BUSY: select count",
                                 COUNT_STEP + "sqlite3_prepare ERROR result=5"));
    EXPECT_EQ(-1, Count());
    EXPECT_EQ(Errors(), fnRepeat(4, READER + " SQLITE_BUSY: GetContactsCount",
                                 " " + READER + " select contacts count ERROR result=5"));
    EXPECT_EQ(-1, ReadOnline(set));
    EXPECT_EQ(m_log.Texts(DEBUG_LINE), Lines(4, "!!! SQLITE_BUSY: select count"));
    m_provider.Unlock();
    EXPECT_EQ(0, Count());
    EXPECT_EQ(1, m_iCount);
    m_provider.LockExclusive();
    m_log.Clear();
    EXPECT_EQ(-1, ReadAll(set));
    const std::string strBusy = COUNT_STEP + "sqlite3_step is busy try ";
    EXPECT_EQ(Errors(), (Lines{strBusy + "1 times", strBusy + "2 times", strBusy + "3 times",
                               COUNT_STEP + "sqlite3_step ERROR result=5"}));
    EXPECT_EQ(-1, Count());
    const std::string strStep = " " + READER + " sqlite3_step error result=5";
    const std::string strTry = strStep + " first, and has try ";
    EXPECT_EQ(Errors(),
              (Lines{strTry + "1 times.", strTry + "2 times.", strTry + "3 times.", strStep}));
    m_provider.Unlock();
}

// The reader's connection forgets the tables' definitions before the query, so that its prepare
// meets the lock, which goes away only after more attempts than any bounded wait makes.
TEST_F(Reader, WaitsForTheRecordQueriesAsLongAsItTakes)
{
    m_provider.PutAll({{1, "a"}, {2, "b"}});
    sqlite3_auto_extension(reinterpret_cast<void (*)()>(&CatchConnection));
    for (const auto& lines : {std::pair(SQLSTAT_4, READER + " SQLITE_BUSY: select from contacts"),
                              std::pair(SQLSTAT_5, READER + " SQLITE_BUSY: select from localizer")})
    {
        int iBusy = 0;
        m_log.AtEachLine(
            [&](const std::string& strText)
            {
                if (strText.find(lines.first) == 0)
                {
                    sqlite3_exec(g_pReaderDB, "pragma writable_schema=reset", nullptr, nullptr,
                                 nullptr);
                    m_provider.LockExclusive();
                }
                else if (strText == lines.second && ++iBusy == 6)
                {
                    m_provider.Unlock();
                }
            });
        tag_ReadSet set;
        EXPECT_EQ(0, ReadAll(set));
        EXPECT_EQ(6, iBusy);
        EXPECT_EQ((Ids{1, 2}), set.IdsRead());
    }
    sqlite3_reset_auto_extension();
}

// The file is replaced by another: an operation that kept its connection still reads the old one.
TEST_F(Reader, KeepsItsConnectionUntilAReadIsComplete)
{
    m_provider.Put({1});
    tag_ReadSet set;
    EXPECT_EQ(0, ReadOnline(set));
    fs::remove(CDataPaths::Database());
    CProviderDatabase().PutAll({{1}, {2}});
    EXPECT_EQ(0, Count());
    EXPECT_EQ(1, m_iCount);
    EXPECT_EQ(0, ReadAll(set));
    EXPECT_EQ(0, Count());
    EXPECT_EQ(2, m_iCount);
}
