#include "Common/DataPaths.h"
#include "tests/DBOperator/ReaderFixture.h"

#include <sqlite3.h>

#include <climits>
#include <filesystem>

namespace
{

using CHostileTest = CReaderTest;
namespace fs = std::filesystem;

sqlite3* g_pReaderDB = nullptr;

// Gives the reader's own connection to the tests.
int CatchConnection(sqlite3* pDB, char** /*pszError*/, const sqlite3_api_routines* /*pApi*/)
{
    g_pReaderDB = pDB;
    return SQLITE_OK;
}

// SQLite's memory, of which only so many allocations are granted. SQLite is told before it starts,
// and to ask for each allocation instead of keeping small ones at hand.
class CSqliteMemory
{
public:
    CSqliteMemory()
    {
        sqlite3_config(SQLITE_CONFIG_GETMALLOC, &s_system);
        sqlite3_mem_methods methods = s_system;
        methods.xMalloc = [](int iSize) { return IsRefused() ? nullptr : s_system.xMalloc(iSize); };
        methods.xRealloc = [](void* pMemory, int iSize)
        { return IsRefused() ? nullptr : s_system.xRealloc(pMemory, iSize); };
        sqlite3_config(SQLITE_CONFIG_MALLOC, &methods);
        sqlite3_config(SQLITE_CONFIG_LOOKASIDE, 0, 0);
    }
    static void Grant(int iNum) { s_iGranted = iNum; }
    static bool RanOut() { return s_iGranted == 0; }

private:
    static bool IsRefused() { return s_iGranted == 0 || --s_iGranted == 0; }

    static inline sqlite3_mem_methods s_system = {};
    static inline int s_iGranted = INT_MAX;
} g_sqliteMemory;

bool StartsWith(const std::string& strText, const std::string& strStart)
{
    return strText.compare(0, strStart.size(), strStart) == 0;
}

const std::string SQLSTAT_4 = "QV_Contacts>>C>>SQLiteOperator>> ReadAllLocalizer>> sqlstat_4";
const std::string SQLSTAT_5 = "QV_Contacts>>C>>SQLiteOperator>> ReadAllLocalizer>> sqlstat_5";
const std::string COUNT_PREPARE = " QV_Contacts >>QV_ContactsLocalize_SO>> ReadAllLocalizer select "
                                  "contacts count sqlite3_prepare ERROR result=";

} // namespace

TEST_F(CHostileTest, AMissingDatabaseIsNotCreated)
{
    fs::remove(CDataPaths::Database());
    CLogCapture log;
    tag_ReadSet set;
    tag_ContactsStruct record{};
    int iCount = 42;
    EXPECT_EQ(-1, ReadAll(set));
    EXPECT_EQ(-1, m_clReader.GetContactsCount(&iCount));
    EXPECT_EQ(-1, m_clReader.ReadContactsByID(1, &record, iCount));
    EXPECT_EQ(-1, m_clReader.ReadAllSmsOnlineStatus(&set, 0, nullptr));
    EXPECT_EQ(42, iCount);
    EXPECT_EQ(nullptr, set.pContacts);
    EXPECT_EQ(Lines(4, "QV_Contacts>>QV_ContactsLocalize_SO>>CSQLiteOperator  open iRetCode = 14"),
              log.Texts(ERROR_LINE));
    EXPECT_FALSE(fs::exists(CDataPaths::Database()));
}

TEST_F(CHostileTest, AFileThatIsNoDatabaseFailsEveryRead)
{
    CDataDirectory::WriteBytes(CDataPaths::Database(), std::string(5000, 'x'));
    CLogCapture log;
    tag_ReadSet set;
    int iCount = 42;
    EXPECT_EQ(-1, ReadAll(set));
    EXPECT_EQ(-1, m_clReader.GetContactsCount(&iCount));
    EXPECT_EQ(-1, m_clReader.ReadAllSmsOnlineStatus(&set, 0, nullptr));
    EXPECT_EQ(42, iCount);
    EXPECT_EQ((Lines{COUNT_PREPARE + "26",
                     " QV_Contacts>>QV_ContactsLocalize_SO>> select contacts count ERROR result=26",
                     " select contacts count ERROR result=26"}),
              log.Texts(ERROR_LINE));
}

TEST_F(CHostileTest, AMissingColumnFailsTheRead)
{
    m_clProvider.PutAll({{1}, {2}});
    m_clProvider.Execute("alter table localizer drop column hasMail");
    tag_ReadSet set;
    EXPECT_EQ(-1, ReadAll(set));
    EXPECT_EQ(2, set.RecordNum);
    m_clProvider.Execute("alter table contacts drop column photo_file_id");
    CSQLiteOperator clReader;
    const CLogCapture log;
    tag_ReadSet another;
    EXPECT_EQ(-1, clReader.ReadAllLocalizer(&another, 0, nullptr));
    EXPECT_EQ(Lines{" QV_Contacts>>QV_ContactsLocalize_SO>> select from contacts ERROR result=1"},
              log.Texts(ERROR_LINE));
}

// A refused allocation must not pass for an empty text: group ids that are numbers become text only
// when they are asked for.
TEST_F(CHostileTest, AReadWithoutMemoryFailsOrIsRight)
{
    m_clProvider.PutAll({{1, "a", "", "1.2"}, {2, "b", "", "7"}});
    m_clProvider.Execute("create table t as select contact_id,display_name,localizerkey,"
                         "cast(id as integer) group_id,account_id,hasMail,hasAddress from (select "
                         "*,group_id id from localizer)");
    m_clProvider.Execute("drop table localizer");
    m_clProvider.Execute("alter table t rename to localizer");
    int iFailed = 0;
    for (bool bRanOut = true; bRanOut;)
    {
        CSQLiteOperator clReader;
        tag_ReadSet set;
        tag_ContactsStruct single = {};
        int iFound = 0;
        CSqliteMemory::Grant(iFailed + 1);
        const int iAll = clReader.ReadAllLocalizer(&set, 0, nullptr);
        const int iSingle = iAll == 0 ? clReader.ReadContactsByID(2, &single, iFound) : -1;
        bRanOut = CSqliteMemory::RanOut();
        CSqliteMemory::Grant(INT_MAX);
        if (iAll == 0)
        {
            EXPECT_EQ(7, set.pContacts[1].lGroupID[0]) << iFailed;
        }
        if (iSingle == 0 && iFound == 1)
        {
            EXPECT_EQ(7, single.lGroupID[0]) << iFailed;
        }
        ++iFailed;
    }
    EXPECT_GT(iFailed, 50) << "SQLite asks for each allocation";
}

TEST_F(CHostileTest, ContactsGoneSinceTheCountFailTheReadAndNewOnesAreLeftOut)
{
    m_clProvider.PutAll({{1, "a"}, {2, "b"}, {4, "d"}});
    std::function<void()> fnChange = [this] { m_clProvider.Remove(2); };
    CLineHook hook(
        [&](const std::string& strText)
        {
            if (StartsWith(strText, SQLSTAT_4))
            {
                fnChange();
            }
        });
    tag_ReadSet set;
    EXPECT_EQ(-1, ReadAll(set));
    EXPECT_EQ((std::vector<int>{1, 4, 0}), set.Ids());
    EXPECT_STREQ(L"d", set.pContacts[1].szName);
    EXPECT_EQ(1, hook.Count("QV_Contacts>>QV_ContactsLocalize_SO>>SQLiteOperator>>"
                            "ReadAllLocalizer: iIndex < pRecord->RecordNum\n"));

    fnChange = [this] { m_clProvider.Put({3, "c"}); };
    tag_ReadSet later;
    EXPECT_EQ(0, ReadAll(later));
    EXPECT_EQ((std::vector<int>{1, 3}), later.Ids());
    EXPECT_EQ(1, hook.Count(" QV_Contacts>>QV_ContactsLocalize_SO>> select from contacts "
                            "sqlite3_step ERROR result=100"));
    EXPECT_EQ(1, hook.Count("QV_Contacts>>QV_ContactsLocalize_SO>> SQLiteOperator>>"
                            "ReadAllLocalizer: sqlite3_step  error from localizer"));
}

// A fresh connection must read the tables' definitions first, and the prepare is busy; one that
// knows them meets the lock in its first step.
TEST_F(CHostileTest, ALockedDatabaseIsTriedForAWhile)
{
    const std::string strDB = "QV_Contacts>>QV_ContactsLocalize_SO>> ";
    const std::string strStep = " QV_Contacts >>QV_ContactsLocalize_SO>> ReadAllLocalizer select "
                                "contacts count sqlite3_step ";
    const std::string strCount = " " + strDB + "sqlite3_step error result=5";
    tag_ReadSet set;
    int iCount = 42;
    const auto ReadErrors = [&]
    {
        CLogCapture log;
        EXPECT_EQ(-1, ReadAll(set));
        return log.Texts(ERROR_LINE);
    };
    const auto CountErrors = [&]
    {
        CLogCapture log;
        EXPECT_EQ(-1, m_clReader.GetContactsCount(&iCount));
        return log.Texts(ERROR_LINE);
    };
    m_clProvider.Put({1});
    m_clProvider.LockExclusive();
    Lines vBusy(4, strDB + "SQLITE_BUSY: select count");
    vBusy.push_back(COUNT_PREPARE + "5");
    EXPECT_EQ(vBusy, ReadErrors());
    EXPECT_EQ(strDB + "SQLITE_BUSY: GetContactsCount", CountErrors()[3]);
    CLogCapture log;
    EXPECT_EQ(-1, m_clReader.ReadAllSmsOnlineStatus(&set, 0, nullptr));
    EXPECT_EQ(Lines(4, "!!! SQLITE_BUSY: select count"), log.Texts(DEBUG_LINE));
    m_clProvider.Unlock();
    EXPECT_EQ(0, m_clReader.GetContactsCount(&iCount));
    EXPECT_EQ(1, iCount);
    m_clProvider.LockExclusive();
    EXPECT_EQ((Lines{strStep + "is busy try 1 times", strStep + "is busy try 2 times",
                     strStep + "is busy try 3 times", strStep + "ERROR result=5"}),
              ReadErrors());
    const std::string strTry = strCount + " first, and has try ";
    EXPECT_EQ((Lines{strTry + "1 times.", strTry + "2 times.", strTry + "3 times.", strCount}),
              CountErrors());
    m_clProvider.Unlock();
}

// The reader's connection forgets the tables' definitions before the query, so that its prepare
// meets the lock, which goes away only after more attempts than any bounded wait makes.
TEST_F(CHostileTest, TheRecordQueriesWaitAsLongAsItTakes)
{
    const std::pair<std::string, std::string> QUERIES[] = {
        {SQLSTAT_4, "QV_Contacts>>QV_ContactsLocalize_SO>> SQLITE_BUSY: select from contacts"},
        {SQLSTAT_5, "QV_Contacts>>QV_ContactsLocalize_SO>> SQLITE_BUSY: select from localizer"}};
    m_clProvider.PutAll({{1, "a"}, {2, "b"}});
    sqlite3_auto_extension(reinterpret_cast<void (*)()>(&CatchConnection));
    for (const auto& query : QUERIES)
    {
        int iBusyLines = 0;
        CLineHook hook(
            [&](const std::string& strText)
            {
                if (StartsWith(strText, query.first))
                {
                    sqlite3_exec(g_pReaderDB, "pragma writable_schema=reset", nullptr, nullptr,
                                 nullptr);
                    m_clProvider.LockExclusive();
                }
                else if (strText == query.second && ++iBusyLines == 6)
                {
                    m_clProvider.Unlock();
                }
            });
        tag_ReadSet set;
        EXPECT_EQ(0, ReadAll(set));
        EXPECT_EQ(6, hook.Count(query.second));
        EXPECT_EQ((std::vector<int>{1, 2}), set.Ids());
    }
    sqlite3_reset_auto_extension();
}

// The file is replaced by another: an operation that kept its connection still reads the old one.
TEST_F(CHostileTest, KeepsItsConnectionUntilAReadIsComplete)
{
    m_clProvider.Put({1});
    tag_ReadSet set;
    int iCount = 0;
    EXPECT_EQ(0, m_clReader.ReadAllSmsOnlineStatus(&set, 0, nullptr));
    fs::remove(CDataPaths::Database());
    CProviderDatabase().PutAll({{1}, {2}});
    EXPECT_EQ(0, m_clReader.GetContactsCount(&iCount));
    EXPECT_EQ(1, iCount);
    EXPECT_EQ(0, ReadAll(set));
    EXPECT_EQ(0, m_clReader.GetContactsCount(&iCount));
    EXPECT_EQ(2, iCount);
}
