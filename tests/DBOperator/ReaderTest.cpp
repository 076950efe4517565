// Reading a real provider database: what its rows become, and what the reader makes of databases
// that are missing, damaged, locked or changed meanwhile.

#include "Common/DataPaths.h"
#include "DBOperator/SQLiteOperator.h"
#include "DBOperator/SqlIdList.h"
#include "tests/Support/DataDirectory.h"
#include "tests/Support/LogCapture.h"
#include "tests/Support/MemoryFailure.h"
#include "tests/Support/ProviderDatabase.h"
#include "tools/Utf8Text.h"

#include <algorithm>
#include <filesystem>
#include <gtest/gtest.h>
#include <sqlite3.h>
#include <sstream>
#include <tuple>

namespace
{

namespace fs = std::filesystem;

using Ids = std::vector<int>;
using Groups = std::vector<QVLong32>;

// The section of log.txt with that name, which stands in a line behind five signs.
std::string Recorded(const std::string& strName)
{
    const std::string strText = "\n" + CDataDirectory::ReadBytes(QV_READER_LOG) + "===== ";
    const std::string strHead = "\n===== " + strName + "\n";
    const size_t uBegin = strText.find(strHead) + strHead.size();
    return strText.substr(uBegin, strText.find("===== ", uBegin) - uBegin);
}

// The numbers from 1 on.
std::string IdText(int iLast)
{
    return iLast == 1 ? "1" : IdText(iLast - 1) + "." + std::to_string(iLast);
}

// What a record holds: its numbers, name, key, groups and accounts.
std::string TextOf(const tag_ContactsStruct& record)
{
    std::ostringstream text;
    text << record.iContactID << ' ' << record.iFlags << ' ' << record.llLastTimeContacted << ' '
         << record.iTimesContacted << ' ' << record.iStatusUpdateID << ' '
         << Utf8Text(record.szName) << ' ' << Utf8Text(record.szLocalizerKey) << " ";
    const char* szSeparator = "";
    for (const QVLong32 lId : record.lGroupID)
    {
        text << (lId == 0 ? "" : szSeparator + std::to_string(lId));
        szSeparator = ".";
    }
    const auto pEnd = std::find(record.lAccountID, std::end(record.lAccountID), 0);
    text << " " << (pEnd - record.lAccountID) << " accounts";
    return text.str();
}

std::string ListText(std::vector<long long> vIds)
{
    return CSqlIdList(static_cast<long>(vIds.size()), vIds.data()).Text();
}

sqlite3* g_pReaderDB = nullptr;

// An SQL function: a value that takes memory once it is asked for, when there is none any more.
void RefuseMemory(sqlite3_context* pContext, int /*iArguments*/, sqlite3_value** /*ppArguments*/)
{
    sqlite3_result_zeroblob(pContext, 5000);
    sqlite3_hard_heap_limit64(1);
}

// Gives the reader's own connection to the tests.
int CatchConnection(sqlite3* pDB, char** /*pszError*/, const sqlite3_api_routines* /*pApi*/)
{
    g_pReaderDB = pDB;
    return sqlite3_create_function(pDB, "refuse_memory", 0, SQLITE_UTF8, nullptr, &RefuseMemory,
                                   nullptr, nullptr);
}

// A reader on an empty provider database in a directory of its own.
class Reader : public testing::Test
{
protected:
    Reader() { sqlite3_auto_extension(reinterpret_cast<void (*)()>(&CatchConnection)); }
    ~Reader() override
    {
        sqlite3_reset_auto_extension();
        delete[] m_set.pContacts;
    }

    int ReadAll(CSQLiteOperator& reader, long lCount = 0, long long* pIds = nullptr)
    {
        delete[] m_set.pContacts;
        m_set = {0, nullptr};
        return reader.ReadAllLocalizer(&m_set, lCount, pIds);
    }
    int ReadAll() { return ReadAll(m_reader); }
    Ids IdsRead() const
    {
        Ids vIds;
        std::transform(m_set.pContacts, m_set.pContacts + m_set.RecordNum, std::back_inserter(vIds),
                       [](const auto& record) { return record.iContactID; });
        return vIds;
    }
    int Count() { return m_reader.GetContactsCount(&m_iCount); }
    int ReadOnline() { return m_reader.ReadAllSmsOnlineStatus(&m_set, 0, nullptr); }

    CDataDirectory m_directory;
    CProviderDatabase m_provider;
    CLogCapture m_log;
    CSQLiteOperator m_reader;
    tag_ContactsInfo m_set = {0, nullptr};
    int m_iCount = 42;
};

} // namespace

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

// The rows of a database and their records, read with all others and then alone, where there may be
// one group more and the status is not read.
TEST_F(Reader, MakesRecordsOfRows)
{
    const std::string strZhang = "张张张张张张张张张张";
    tag_DatabaseContact full = {-4, "安", "k", IdText(101), "6", 1'700'000'000'123, 2, 8};
    full.bSecret = full.bMail = full.bPhone = true;
    tag_DatabaseContact secret = {1, "", "", "7.x.9", IdText(21)};
    secret.bSecret = secret.bStarred = secret.bAddress = true;
    m_provider.PutAll({full,
                       secret,
                       {2, std::string(40, 'x'), std::string(40, 'x')},
                       {3, strZhang + strZhang, strZhang + strZhang},
                       // The last character would end behind the limit.
                       {4, "x" + strZhang, "x" + strZhang},
                       // Not UTF-8 from some byte on.
                       {5, "ab\xF0\x9F\x98\x80zz", std::string("ab\0cd", 5)}});
    ASSERT_EQ(0, ReadAll());
    ASSERT_EQ(6, m_set.RecordNum);
    std::ostringstream read;
    const auto ReadAlone = [&](int iId)
    {
        tag_ContactsStruct record = {};
        record.iStatusUpdateID = 77;
        int iFound = 5;
        EXPECT_EQ(0, m_reader.ReadContactsByID(iId, &record, iFound));
        read << "found " << iFound << ": " << TextOf(record) << '\n';
    };
    for (int i = 0; i < m_set.RecordNum; ++i)
    {
        read << TextOf(m_set.pContacts[i]) << '\n';
        ReadAlone(m_set.pContacts[i].iContactID);
    }
    // Found tells of the name row; a hidden contact is read alone.
    m_provider.Execute("delete from contacts where _id=1; delete from localizer where "
                       "contact_id=2; delete from visible_contacts");
    for (const int iId : {1, 2, 3, 99})
    {
        ReadAlone(iId);
    }
    EXPECT_EQ(read.str(), Recorded("records"));
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
        ASSERT_EQ(0, ReadAll(m_reader, lCount, vIds.data()));
        EXPECT_EQ(vRead, IdsRead()) << lCount;
    }
    EXPECT_EQ(m_log.Take(), Recorded("one listed contact"));
}

// With its table and, without memory, without it.
TEST_F(Reader, MarksTheFirstRecordOfEachOnlineStatus)
{
    int iId = 0;
    for (const int iStatusId : {9, 7, 0, 8, 9, 0, -5, 12})
    {
        m_provider.Put({++iId, "", "", "", "", 0, 0, iStatusId});
    }
    m_provider.Execute("insert into status_updates values(-5,'online'),(0,'online'),(7,'away'),"
                       "(8,null),(9,'online'),(11,'online'),(12,'Online'),(13,'online')");
    ASSERT_EQ(0, ReadAll());
    for (const int iGranted : {1000, 0})
    {
        EXPECT_EQ(0, Count()); // opens the database
        m_log.Clear();
        const CMemoryFailure failure(iGranted);
        EXPECT_EQ(0, ReadOnline()) << iGranted;
        for (int i = 0; i < 8; ++i)
        {
            EXPECT_EQ(i == 0 || i == 2 || i == 6 ? CONTACT_FLAG_ONLINE : 0,
                      m_set.pContacts[i].iFlags);
            m_set.pContacts[i].iFlags = CONTACT_FLAG_ONLINE;
        }
        EXPECT_EQ(m_log.Take(), Recorded("online"));
    }
    const CMemoryFailure failure(0);
    EXPECT_EQ(-1, ReadAll());
    EXPECT_EQ(m_log.Take(), Recorded("no memory"));
}

// A refused allocation must not pass for an empty text.
TEST_F(Reader, FailsWhereSqliteHasNoMemoryForATextOfTheLastRow)
{
    m_provider.Put({1, "a"});
    m_provider.Execute("alter table localizer rename to names;"
                       "create view localizer as select contact_id, display_name, localizerkey, "
                       "group_id, refuse_memory() as account_id, hasMail, hasAddress from names");
    tag_ContactsStruct record = {};
    EXPECT_EQ(-1, ReadAll());
    sqlite3_hard_heap_limit64(0);
    EXPECT_EQ(-1, m_reader.ReadContactsByID(1, &record, m_iCount));
    sqlite3_hard_heap_limit64(0);
    EXPECT_EQ(1, m_iCount) << "found";
}

TEST_F(Reader, FailsOnWhatIsNoProviderDatabase)
{
    const auto TryAll = [this]
    {
        CSQLiteOperator reader;
        tag_ContactsStruct record = {};
        int iFound = 0;
        return Ids{ReadAll(reader), reader.ReadContactsByID(1, &record, iFound),
                   reader.GetContactsCount(&m_iCount),
                   reader.ReadAllSmsOnlineStatus(&m_set, 0, nullptr)};
    };
    const Ids vAllFail(4, -1);
    fs::remove(CDataPaths::Database());
    EXPECT_EQ(TryAll(), vAllFail);
    EXPECT_FALSE(fs::exists(CDataPaths::Database()));
    CDataDirectory::WriteBytes(CDataPaths::Database(), std::string(5000, 'x'));
    EXPECT_EQ(TryAll(), vAllFail);
    EXPECT_EQ(42, m_iCount);
    EXPECT_EQ(nullptr, m_set.pContacts);

    fs::remove(CDataPaths::Database());
    CProviderDatabase provider;
    provider.PutAll({{1}, {2}});
    for (const char* szMissing :
         {"localizer drop column hasMail", "contacts drop column photo_file_id"})
    {
        provider.Execute(std::string("alter table ") + szMissing);
        EXPECT_EQ(TryAll(), (Ids{-1, -1, 0, 0}));
    }
    EXPECT_EQ(2, m_set.RecordNum);
    EXPECT_EQ(m_log.Take(), Recorded("no provider database"));
}

TEST_F(Reader, FailsWithoutContactsGoneSinceTheCountAndLeavesNewOnesOut)
{
    m_provider.PutAll({{1, "a"}, {2, "b"}, {4, "d"}});
    bool bRemoves = true;
    const auto fnChange = [&] { bRemoves ? m_provider.Remove(2) : m_provider.Put({3, "c"}); };
    m_log.AtLinesWith("sqlstat_4", fnChange);
    EXPECT_EQ(-1, ReadAll());
    EXPECT_EQ((Ids{1, 4, 0}), IdsRead());
    EXPECT_STREQ(L"d", m_set.pContacts[1].szName);
    bRemoves = false;
    EXPECT_EQ(0, ReadAll());
    EXPECT_EQ((Ids{1, 3}), IdsRead());
    EXPECT_EQ(m_log.Take(), Recorded("contacts come and go"));
}

// A fresh connection must read the tables' definitions first, and the prepare is busy; one that
// knows them meets the lock in its first step.
TEST_F(Reader, TriesALockedDatabaseForAWhile)
{
    m_provider.Put({1});
    m_provider.LockExclusive();
    EXPECT_EQ(-1, ReadAll());
    EXPECT_EQ(-1, Count());
    EXPECT_EQ(-1, ReadOnline());
    m_provider.Unlock();
    EXPECT_EQ(0, Count());
    EXPECT_EQ(1, m_iCount);
    m_provider.LockExclusive();
    EXPECT_EQ(-1, ReadAll());
    EXPECT_EQ(-1, Count());
    m_provider.Unlock();
    EXPECT_EQ(m_log.Take(), Recorded("locked"));
}

// The reader's connection forgets the tables' definitions before the query, so that its prepare
// meets the lock, which goes away only after more attempts than any bounded wait makes.
TEST_F(Reader, WaitsForTheRecordQueriesAsLongAsItTakes)
{
    m_provider.PutAll({{1, "a"}, {2, "b"}});
    const std::string strBusy = "QV_Contacts>>QV_ContactsLocalize_SO>> SQLITE_BUSY: select from ";
    for (const auto& query :
         {std::pair("sqlstat_4", "contacts"), std::pair("sqlstat_5", "localizer")})
    {
        int iBusy = 0;
        m_log.AtEachLine(
            [&](const std::string& strText)
            {
                if (strText.find(query.first) != std::string::npos)
                {
                    sqlite3_exec(g_pReaderDB, "pragma writable_schema=reset", nullptr, nullptr,
                                 nullptr);
                    m_provider.LockExclusive();
                }
                else if (strText == strBusy + query.second && ++iBusy == 6)
                {
                    m_provider.Unlock();
                }
            });
        EXPECT_EQ(0, ReadAll());
        EXPECT_EQ(6, iBusy);
        EXPECT_EQ((Ids{1, 2}), IdsRead());
    }
}

// The file is replaced by another: who kept his connection still reads the old one.
TEST_F(Reader, KeepsItsConnectionUntilARecordReadIsComplete)
{
    m_provider.Put({1});
    EXPECT_EQ(0, ReadOnline());
    for (const bool bAll : {true, false})
    {
        EXPECT_EQ(0, Count());
        const int iOld = m_iCount;
        fs::remove(CDataPaths::Database());
        CProviderDatabase().PutAll({{1}, {2}, {3, "", "", "", "", 0, 0, 0, "", bAll}});
        EXPECT_EQ(0, Count());
        EXPECT_EQ(iOld, m_iCount);
        tag_ContactsStruct record = {};
        EXPECT_EQ(0, bAll ? ReadAll() : m_reader.ReadContactsByID(1, &record, m_iCount));
        EXPECT_EQ(0, Count());
        EXPECT_EQ(bAll ? 3 : 2, m_iCount);
    }
}
