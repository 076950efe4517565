#include "Common/DataPaths.h"
#include "tests/DBOperator/ReaderFixture.h"

#include <sqlite3.h>

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

class CConnectionCatcher
{
public:
    CConnectionCatcher() { sqlite3_auto_extension(Entry()); }
    ~CConnectionCatcher() { sqlite3_cancel_auto_extension(Entry()); }

private:
    static void (*Entry())() { return reinterpret_cast<void (*)()>(&CatchConnection); }
};

bool StartsWith(const std::string& strText, const std::string& strStart)
{
    return strText.compare(0, strStart.size(), strStart) == 0;
}

const std::string SQLSTAT_4 = "QV_Contacts>>C>>SQLiteOperator>> ReadAllLocalizer>> sqlstat_4";
const std::string SQLSTAT_5 = "QV_Contacts>>C>>SQLiteOperator>> ReadAllLocalizer>> sqlstat_5";
const std::string COUNT_PREPARE = " QV_Contacts >>QV_ContactsLocalize_SO>> ReadAllLocalizer select "
                                  "contacts count sqlite3_prepare ERROR result=";
const std::string COUNT_STEP = " QV_Contacts >>QV_ContactsLocalize_SO>> ReadAllLocalizer select "
                               "contacts count sqlite3_step ERROR result=";
const std::string OPEN_FAILED =
    "QV_Contacts>>QV_ContactsLocalize_SO>>CSQLiteOperator  open iRetCode = 14";

} // namespace

TEST_F(CHostileTest, AMissingDatabaseIsNotCreated)
{
    fs::remove(CDataPaths::Database());
    for (const bool bWithDirectory : {true, false})
    {
        if (!bWithDirectory)
        {
            fs::remove(fs::path(CDataPaths::Database()).parent_path());
        }
        CLogCapture log;
        tag_ReadSet set;
        tag_ContactsStruct record{};
        int iCount = 42;
        EXPECT_EQ(-1, m_clReader.open());
        EXPECT_EQ(-1, ReadAll(set));
        EXPECT_EQ(-1, m_clReader.GetContactsCount(&iCount));
        EXPECT_EQ(-1, m_clReader.ReadContactsByID(1, &record, iCount));
        EXPECT_EQ(-1, m_clReader.ReadAllSmsOnlineStatus(&set, 0, nullptr));
        EXPECT_EQ(42, iCount);
        EXPECT_EQ(nullptr, set.pContacts);
        EXPECT_EQ(std::vector<std::string>(5, OPEN_FAILED), log.Texts(ERROR_LINE));
        EXPECT_FALSE(fs::exists(CDataPaths::Database()));
    }
}

TEST_F(CHostileTest, AFileThatIsNoDatabaseFailsEveryRead)
{
    const std::string strRandom(5000, 'x');
    for (const std::string& strBytes : {strRandom, std::string(), std::string("SQLite format 3")})
    {
        CDataDirectory::WriteBytes(CDataPaths::Database(), strBytes);
        const std::string strCode = strBytes.empty() ? "1" : "26";
        CSQLiteOperator clReader;
        CLogCapture log;
        tag_ReadSet set;
        int iCount = 42;
        EXPECT_EQ(-1, clReader.ReadAllLocalizer(&set, 0, nullptr));
        EXPECT_EQ(-1, clReader.GetContactsCount(&iCount));
        EXPECT_EQ(-1, clReader.ReadAllSmsOnlineStatus(&set, 0, nullptr));
        EXPECT_EQ(42, iCount);
        const std::vector<std::string> EXPECTED = {
            COUNT_PREPARE + strCode,
            " QV_Contacts>>QV_ContactsLocalize_SO>> select contacts count ERROR result=" + strCode,
            " select contacts count ERROR result=" + strCode};
        EXPECT_EQ(EXPECTED, log.Texts(ERROR_LINE));
    }
}

TEST_F(CHostileTest, DamagedPagesEndTheReadWithoutACrash)
{
    std::vector<tag_ProviderContact> vContacts;
    for (int i = 1; i <= 400; ++i)
    {
        vContacts.push_back({i, std::string(30, 'n'), "k", "1.2", "3"});
    }
    m_clProvider.PutAll(vContacts);
    const std::string strWhole = CDataDirectory::ReadBytes(CDataPaths::Database());
    for (size_t uAt = 100; uAt < strWhole.size(); uAt += 512)
    {
        std::string strDamaged = strWhole;
        strDamaged.replace(uAt, std::min<size_t>(200, strWhole.size() - uAt), 200, '\xA5');
        CDataDirectory::WriteBytes(CDataPaths::Database(), strDamaged);
        CSQLiteOperator clReader;
        CLogCapture log;
        tag_ReadSet set;
        const int iResult = clReader.ReadAllLocalizer(&set, 0, nullptr);
        EXPECT_EQ(iResult != 0, log.Has(ERROR_LINE, LINE_MERGE_SHORT) || set.RecordNum == 0) << uAt;
        clReader.ReadAllSmsOnlineStatus(&set, 0, nullptr);
    }
}

TEST_F(CHostileTest, AMissingTableOrColumnNamesItsQuery)
{
    const struct
    {
        const char* szSql;
        std::vector<std::string> vErrors;
        bool bArray;
    } CASES[] = {
        {"alter table localizer drop column hasMail", {}, true},
        {"alter table contacts drop column photo_file_id",
         {" QV_Contacts>>QV_ContactsLocalize_SO>> select from contacts ERROR result=1"},
         true},
        {"drop table visible_contacts", {COUNT_PREPARE + "1"}, false},
    };
    m_clProvider.PutAll({{1}, {2}});
    for (const auto& one : CASES)
    {
        m_clProvider.Execute(one.szSql);
        CSQLiteOperator clReader;
        CLogCapture log;
        tag_ReadSet set;
        EXPECT_EQ(-1, clReader.ReadAllLocalizer(&set, 0, nullptr)) << one.szSql;
        EXPECT_EQ(one.vErrors, log.Texts(ERROR_LINE)) << one.szSql;
        EXPECT_EQ(one.bArray, set.pContacts != nullptr) << one.szSql;
        EXPECT_EQ(one.bArray ? 2 : 0, set.RecordNum) << one.szSql;
    }
}

// NULL, text, a blob, a real and a number of more than 32 bits in a column of each kind.
TEST_F(CHostileTest, TakesAnyTypeInAColumn)
{
    const char* const VALUES[] = {"null", "'text'", "x'E5BCA000FF'", "-1.5e300",
                                  "-4611686018427387904"};
    const char* const COLUMNS[][2] = {
        {"contacts", "last_time_contacted"}, {"contacts", "starred"},
        {"localizer", "display_name"},       {"localizer", "localizerkey"},
        {"localizer", "group_id"},           {"localizer", "hasMail"}};
    m_clProvider.PutAll({{1, "a"}, {2, "b"}});
    for (const auto& column : COLUMNS)
    {
        for (const char* szValue : VALUES)
        {
            m_clProvider.Execute(std::string("update ") + column[0] + " set " + column[1] + "=" +
                                 szValue);
            tag_ReadSet set;
            EXPECT_EQ(0, ReadAll(set)) << column[1] << szValue;
            EXPECT_EQ((std::vector<int>{1, 2}), set.Ids()) << column[1] << szValue;
            tag_ContactsStruct record{};
            int iFound = 0;
            EXPECT_EQ(0, m_clReader.ReadContactsByID(1, &record, iFound));
        }
    }
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
    EXPECT_STREQ(L"", set.pContacts[2].szName);
    EXPECT_EQ(1, hook.Count(LINE_MERGE_SHORT));

    fnChange = [this] { m_clProvider.Put({3, "c"}); };
    tag_ReadSet later;
    EXPECT_EQ(0, ReadAll(later));
    EXPECT_EQ((std::vector<int>{1, 3}), later.Ids());
    EXPECT_EQ(1, hook.Count(LINE_CONTACTS_STEP + std::string("100")));
    EXPECT_EQ(1, hook.Count(LINE_LOCALIZER_STEP));
}

// A fresh connection must read the tables' definitions first, and the prepare is busy; one that
// knows them meets the lock in its first step.
TEST_F(CHostileTest, ALockedDatabaseIsTriedForAWhile)
{
    m_clProvider.Put({1});
    m_clProvider.LockExclusive();
    tag_ReadSet set;
    int iCount = 42;
    {
        CLogCapture log;
        EXPECT_EQ(-1, ReadAll(set));
        const std::string strBusy = "QV_Contacts>>QV_ContactsLocalize_SO>> SQLITE_BUSY: select "
                                    "count";
        EXPECT_EQ(
            (std::vector<std::string>{strBusy, strBusy, strBusy, strBusy, COUNT_PREPARE + "5"}),
            log.Texts(ERROR_LINE));
        EXPECT_EQ(-1, m_clReader.GetContactsCount(&iCount));
        EXPECT_EQ(4, log.Count(ERROR_LINE, "QV_Contacts>>QV_ContactsLocalize_SO>> SQLITE_BUSY: "
                                           "GetContactsCount"));
        log.Clear();
        EXPECT_EQ(-1, m_clReader.ReadAllSmsOnlineStatus(&set, 0, nullptr));
        EXPECT_EQ(
            (std::vector<tag_LogLine>(4, {DEBUG_LINE, DB_TAG, "!!! SQLITE_BUSY: select count"})),
            log.Lines());
    }
    m_clProvider.Unlock();
    EXPECT_EQ(0, m_clReader.GetContactsCount(&iCount));
    EXPECT_EQ(1, iCount);
    m_clProvider.LockExclusive();
    CLogCapture log;
    const std::string strTry = " QV_Contacts >>QV_ContactsLocalize_SO>> ReadAllLocalizer select "
                               "contacts count sqlite3_step is busy try ";
    EXPECT_EQ(-1, ReadAll(set));
    EXPECT_EQ((std::vector<std::string>{strTry + "1 times", strTry + "2 times", strTry + "3 times",
                                        COUNT_STEP + "5"}),
              log.Texts(ERROR_LINE));
    log.Clear();
    EXPECT_EQ(-1, m_clReader.GetContactsCount(&iCount));
    const std::string strCountTry = " QV_Contacts>>QV_ContactsLocalize_SO>> sqlite3_step error "
                                    "result=5 first, and has try ";
    EXPECT_EQ((std::vector<std::string>{
                  strCountTry + "1 times.", strCountTry + "2 times.", strCountTry + "3 times.",
                  " QV_Contacts>>QV_ContactsLocalize_SO>> sqlite3_step error result=5"}),
              log.Texts(ERROR_LINE));
    log.Clear();
    EXPECT_EQ(-1, m_clReader.ReadAllSmsOnlineStatus(&set, 0, nullptr));
    EXPECT_TRUE(log.Lines().empty());
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
    const CConnectionCatcher catcher;
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
}

// The file is replaced by another: an operation that kept its connection still reads the old one.
TEST_F(CHostileTest, KeepsItsConnectionUntilAReadIsComplete)
{
    m_clProvider.Put({1});
    const auto Count = [this]
    {
        int iCount = -1;
        m_clReader.GetContactsCount(&iCount);
        return iCount;
    };
    tag_ReadSet set;
    EXPECT_EQ(1, Count());
    EXPECT_EQ(0, m_clReader.ReadAllSmsOnlineStatus(&set, 0, nullptr));
    fs::remove(CDataPaths::Database());
    CProviderDatabase clOther;
    clOther.PutAll({{1}, {2}});
    EXPECT_EQ(1, Count());
    EXPECT_EQ(0, ReadAll(set));
    EXPECT_EQ(2, Count());
}
