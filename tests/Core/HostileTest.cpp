// The facade in surroundings that nobody wants: damaged files, missing rights, no room. Whatever
// it meets, every operation comes back with a result code or an empty result, nothing reads or
// writes out of bounds, and as soon as the surroundings are in order again so is the index.

#include "MemManager/MemManger.h"
#include "Platform/LogSink.h"
#include "tests/Core/FacadeFixture.h"
#include "tests/Support/ChildProcess.h"
#include "tests/Support/StoreImage.h"

#include <csignal>
#include <filesystem>
#include <functional>
#include <memory>
#include <random>
#include <set>
#include <sys/resource.h>
#include <sys/stat.h>
#include <unistd.h>

namespace
{

namespace fs = std::filesystem;

constexpr int CONTACTS = 40;

class CHostileTest : public CFacadeTest
{
protected:
    CHostileTest()
    {
        std::vector<tag_ProviderContact> vContacts;
        const std::vector<std::string> vNames = {"张三", "Tom", "", "重庆", "7#", "李Lee"};
        for (int i = 1; i <= CONTACTS; ++i)
        {
            tag_ProviderContact contact;
            contact.iId = i;
            contact.strName = vNames[static_cast<size_t>(i) % vNames.size()];
            contact.strGroups = "1.2";
            contact.iStatusId = 100 + i;
            contact.bOnline = i % 3 == 0;
            vContacts.push_back(contact);
        }
        Store(vContacts);
    }

    void Build() { ASSERT_EQ(m_logic.MemInit(true), 0); }

    static void Damage(const char* szPath, const std::string& strBytes)
    {
        CDataDirectory::WriteBytes(szPath, strBytes);
    }

    static std::string RandomBytes(size_t uBytes, unsigned int uSeed)
    {
        std::mt19937 random(uSeed);
        std::string strBytes(uBytes, '\0');
        for (char& c : strBytes)
        {
            c = static_cast<char>(random());
        }
        return strBytes;
    }

    static std::string RegBytes(int32_t iTotal, int32_t iSortType, int32_t iMemSize)
    {
        const tag_ContactReg reg = {iTotal, iSortType, iMemSize};
        return {reinterpret_cast<const char*>(&reg), sizeof(reg)};
    }

    // Searches of every kind, typed on. Whatever they find keeps to its fields.
    void SearchEverywhere()
    {
        const auto pChain = Chain({{0, 1}, {9, 3}, {11, 0}});
        for (const IME_SEARCH_TYPE eType : {IME_SEARCH_WORD, IME_SEARCH_NUM, IME_SEARCH_SPECIAL})
        {
            for (CFilterChain* pFilter : {&m_everybody, pChain.get()})
            {
                Set last;
                for (const char* szText : {"", "z", "zh", "zh9", "zh9张"})
                {
                    const tag_Found found = Search(szText, eType, last, pFilter);
                    ExpectSane(found);
                    last = found.set;
                }
            }
        }
    }

    void ExpectSane(const tag_Found& found)
    {
        EXPECT_TRUE(found.iRet == 0 || found.iRet == LOC_ERR_MAP || found.iRet == -1);
        EXPECT_EQ(found.set != nullptr, found.iRet == 0);
        for (int i = 0; found.set != nullptr && i < found.set->iResultNum; ++i)
        {
            EXPECT_EQ(found.Entry(i).szLocalizerKey[CONTACT_MAX_KEY], 0);
            EXPECT_EQ(found.Entry(i).szReserved[4], 0);
        }
        if (found.set != nullptr)
        {
            int aiCounts[27] = {};
            EXPECT_EQ(m_logic.GetFirstWordInfo(found.set.get(), aiCounts), 0);
            EXPECT_GE(m_logic.GetIndexByContactsId(found.set.get(), 5), 0);
        }
    }

    void ConvertNames()
    {
        wchar_t szName[CONTACT_MAX_NAME + 1] = L"张三Tom 2";
        wchar_t szOut[64] = {};
        m_logic.GetLocalizer(szName, szOut);
        m_logic.GetLocalizerString(szName, 3, szName, szOut);
        const long hMap = m_logic.CreatePinYinFileMapping();
        if (hMap > 0)
        {
            EXPECT_EQ(m_logic.GetLocalizerString(hMap, szName, szOut), 0);
            EXPECT_EQ(m_logic.ReleasePinYinFileMapping(hMap), 0);
        }
        tag_ContactsStruct record = {};
        tag_ContactsInfo info = {1, &record};
        m_logic.GetLocalizerBatch(&info);
    }

    void TellChanges()
    {
        m_logic.OnContactTimeChanged(5, 1'700'000'000'000);
        m_logic.OnContactStarChanged(5, 1);
        long long allIds[] = {1, 2, 3, 500};
        m_logic.OnContactsTableChanged(4, allIds);
        m_logic.OnStatusUpdatesTableChanged(0, nullptr);
        m_logic.OnGetSortType();
        m_logic.SetSortType(m_logic.GetSortType() == 1 ? 0 : 1);
        m_logic.OnContactsTableChanged();
    }

    void CopyOut()
    {
        tag_ContactsInfo* pInfo = nullptr;
        CMemManger().GetContactsResult(&pInfo);
        ASSERT_NE(pInfo, nullptr);
        delete[] pInfo->pContacts;
        delete pInfo;
    }

    // In an order in which what comes early repairs nothing.
    void UseEverything()
    {
        m_logic.MemInit(false);
        SearchEverywhere();
        ConvertNames();
        CopyOut();
        TellChanges();
        SearchEverywhere();
        m_logic.MemInit(true);
        SearchEverywhere();
    }

    void ExpectWorking()
    {
        ASSERT_EQ(m_logic.MemInit(true), 0);
        const tag_StoreImage store = ReadStore();
        EXPECT_EQ(DifferenceOf(store, FreshBuild(m_directory.Root(), store.reg.iSortType)), "");
        EXPECT_EQ(Search("").Contacts().size(), static_cast<size_t>(CONTACTS));
        EXPECT_EQ(Search("zs").Contacts().size(), 6U);
    }
};

// --- Damaged files -----------------------------------------------------------------------------

TEST_F(CHostileTest, DamagedFilesHarmNobody)
{
    Build();
    const std::string strRecords = RecordsFile();
    const std::string strShort(strRecords, 0, 704 * 3 + 100);
    const struct
    {
        const char* szWhat;
        std::function<void()> fnDamage;
    } cases[] = {
        {"no registration record", [] { fs::remove(CDataPaths::ContactReg()); }},
        {"an empty one", [] { Damage(CDataPaths::ContactReg(), ""); }},
        {"one byte of it", [] { Damage(CDataPaths::ContactReg(), "\x28"); }},
        {"eleven bytes of it",
         [] { Damage(CDataPaths::ContactReg(), RegBytes(40, 0, 9).substr(1)); }},
        {"negative counts", [] { Damage(CDataPaths::ContactReg(), RegBytes(-1, 0, -40)); }},
        {"the largest counts",
         [] { Damage(CDataPaths::ContactReg(), RegBytes(INT32_MAX, 0, INT32_MAX)); }},
        {"a count whose bytes wrap around",
         [] { Damage(CDataPaths::ContactReg(), RegBytes(6101805, 0, 6101805)); }},
        {"a capacity of 2 GB", [] { Damage(CDataPaths::ContactReg(), RegBytes(40, 0, 3000000)); }},
        {"more contacts than records",
         [] { Damage(CDataPaths::ContactReg(), RegBytes(1041, 0, 1041)); }},
        {"an unknown sort type",
         [] { Damage(CDataPaths::ContactReg(), RegBytes(40, -559038737, 1040)); }},
        {"a random registration record",
         [] { Damage(CDataPaths::ContactReg(), RandomBytes(12, 5)); }},
        {"a directory in its place",
         []
         {
             fs::remove(CDataPaths::ContactReg());
             fs::create_directory(CDataPaths::ContactReg());
         }},
        {"no records file", [] { fs::remove(CDataPaths::ContactRecords()); }},
        {"an empty records file", [] { Damage(CDataPaths::ContactRecords(), ""); }},
        {"a records file that ends in a record",
         [&] { Damage(CDataPaths::ContactRecords(), strShort); }},
        {"random records",
         [&] { Damage(CDataPaths::ContactRecords(), RandomBytes(strRecords.size(), 6)); }},
        {"records without any terminator",
         [&] { Damage(CDataPaths::ContactRecords(), std::string(strRecords.size(), '\x7f')); }},
        {"records with every bit set",
         [&] { Damage(CDataPaths::ContactRecords(), std::string(strRecords.size(), '\xff')); }},
        {"no pinyin mapping", [] { fs::remove(CDataPaths::PinyinMapping()); }},
        {"an empty pinyin mapping", [] { Damage(CDataPaths::PinyinMapping(), ""); }},
        {"half a pinyin mapping",
         []
         {
             const std::string strTable = CDataDirectory::ReadBytes(CDataPaths::PinyinMapping());
             Damage(CDataPaths::PinyinMapping(), strTable.substr(0, strTable.size() / 2));
         }},
        {"a random pinyin mapping",
         [] { Damage(CDataPaths::PinyinMapping(), RandomBytes(PY_FILE_SIZE, 7)); }},
        {"a pinyin mapping without any terminator",
         [] { Damage(CDataPaths::PinyinMapping(), std::string(PY_FILE_SIZE, 'z')); }},
        {"no shipped pinyin table", [] { fs::remove(CDataPaths::PinyinSource()); }},
        {"a short one", [] { Damage(CDataPaths::PinyinSource(), "abc"); }},
        {"a random one",
         [] { Damage(CDataPaths::PinyinSource(), RandomBytes(PY_FILE_SIZE * 2, 8)); }},
    };
    for (const auto& row : cases)
    {
        SCOPED_TRACE(row.szWhat);
        row.fnDamage();
        UseEverything();
        fs::remove_all(m_directory.Root() + "/files");
        fs::create_directory(m_directory.Root() + "/files");
        m_directory.InstallPinyinTable();
        ExpectWorking();
    }
}

TEST_F(CHostileTest, AnyDamageHarmsNobody)
{
    const unsigned int uSeed = 11;
    SCOPED_TRACE("seed " + std::to_string(uSeed));
    std::mt19937 random(uSeed);
    Build();
    for (int iRound = 0; iRound < 25; ++iRound)
    {
        for (const char* szPath :
             {CDataPaths::ContactReg(), CDataPaths::ContactRecords(), CDataPaths::PinyinMapping()})
        {
            std::string strBytes = CDataDirectory::ReadBytes(szPath);
            for (auto i = random() % 40; i > 0 && !strBytes.empty(); --i)
            {
                strBytes[random() % strBytes.size()] = static_cast<char>(random());
            }
            Damage(szPath, strBytes);
        }
        UseEverything();
    }
    ExpectWorking();
}

// A damaged registration record: readers find nothing, times and stars do nothing, contacts and
// status rebuild.
TEST_F(CHostileTest, ChangesRepairADamagedRecord)
{
    Build();
    for (const bool bStatus : {false, true})
    {
        Damage(CDataPaths::ContactReg(), RegBytes(41, 1, 99'999));
        const std::string strRecords = RecordsFile();
        EXPECT_TRUE(Search("").Contacts().empty());
        EXPECT_EQ(m_logic.OnGetSortType(), 0);
        m_logic.OnContactTimeChanged(1, 5);
        m_logic.OnContactStarChanged(1, 1);
        EXPECT_EQ(RecordsFile(), strRecords);
        long long llId = 1;
        if (bStatus)
        {
            m_logic.OnStatusUpdatesTableChanged(0, nullptr);
        }
        else
        {
            m_logic.OnContactsTableChanged(1, &llId);
        }
        EXPECT_EQ(Reg(), (tag_ContactReg{CONTACTS, 0, CONTACTS + STORE_SPARE_RECORDS}));
        EXPECT_EQ(DifferenceOf(ReadStore(), FreshBuild(m_directory.Root(), 0)), "");
    }
}

// --- Surroundings ------------------------------------------------------------------------------

// Does something when a handler has waited for the lock for a while.
class CAfterRefusals
{
public:
    CAfterRefusals(int iRefusals, std::function<void()> fnThen)
        : m_iLeft(iRefusals), m_fnThen(std::move(fnThen))
    {
        CLogSink::Set(&CAfterRefusals::Receive, this);
    }
    ~CAfterRefusals() { CLogSink::Set(nullptr, nullptr); }
    CAfterRefusals(const CAfterRefusals&) = delete;
    CAfterRefusals& operator=(const CAfterRefusals&) = delete;

    int Left() const { return m_iLeft; }

private:
    static void Receive(void* pContext, int /*iPriority*/, const char* /*szTag*/,
                        const char* szText)
    {
        auto* pThis = static_cast<CAfterRefusals*>(pContext);
        if (std::strstr(szText, "Lock share mem false") != nullptr && --pThis->m_iLeft == 0)
        {
            pThis->m_fnThen();
        }
    }

    int m_iLeft;
    std::function<void()> m_fnThen;
};

TEST_F(CHostileTest, ALockFileThatIsADirectoryRefusesEverybody)
{
    Build();
    fs::remove(CDataPaths::LockFile());
    fs::create_directory(CDataPaths::LockFile());
    EXPECT_EQ(m_logic.MemInit(true), -1);
    EXPECT_TRUE(Search("z").Contacts().empty());
    long long llId = 1;
    const std::function<void()> waiting[] = {
        [&] { m_logic.OnContactsTableChanged(1, &llId); },
        [&] { m_logic.OnStatusUpdatesTableChanged(0, nullptr); },
        [&] { m_logic.OnContactTimeChanged(1, 5); },
        [&] { m_logic.OnContactStarChanged(1, 0); },
        [&] { CopyOut(); },
    };
    for (const auto& fnCall : waiting)
    {
        fs::remove_all(CDataPaths::LockFile());
        fs::create_directory(CDataPaths::LockFile());
        const CAfterRefusals refusals(3, [] { fs::remove(CDataPaths::LockFile()); });
        fnCall();
        EXPECT_EQ(refusals.Left(), 0);
    }
    m_provider.SetLastTime(1, 5);
    ExpectWorking();
}

TEST_F(CHostileTest, NoFilesDirectory)
{
    Build();
    fs::rename(m_directory.Root() + "/files", m_directory.Root() + "/elsewhere");
    EXPECT_EQ(m_logic.MemInit(true), LOC_ERR_MAP);
    EXPECT_EQ(m_logic.MemInit(false), LOC_ERR_MAP);
    EXPECT_EQ(Search("z").iRet, LOC_ERR_MAP);
    ConvertNames();
    m_logic.OnContactsTableChanged();
    m_logic.SetSortType(1);
    EXPECT_EQ(m_logic.OnGetSortType(), 0);
    fs::rename(m_directory.Root() + "/elsewhere", m_directory.Root() + "/files");
    ExpectWorking();
}

TEST_F(CHostileTest, AProcessWithoutRightsReadsOrFails)
{
    Build();
    chmod(m_directory.Root().c_str(), 0755);
    for (const bool bReadable : {true, false})
    {
        for (const char* szPath : {CDataPaths::ContactRecords(), CDataPaths::ContactReg(),
                                   CDataPaths::PinyinMapping(), CDataPaths::PinyinSource()})
        {
            chmod(szPath, bReadable ? 0444 : 0);
        }
        chmod((m_directory.Root() + "/files").c_str(), 0555);
        EXPECT_TRUE(RunInChild(
            [&]
            {
                DropRoot();
                EXPECT_EQ(m_logic.MemInit(true), LOC_ERR_MAP);
                EXPECT_EQ(m_logic.MemInit(false), 0) << "an index is there";
                const tag_Found found = Search("");
                EXPECT_EQ(found.iRet, bReadable ? 0 : LOC_ERR_MAP);
                EXPECT_EQ(found.Contacts().size(), bReadable ? CONTACTS : 0U);
                SearchEverywhere();
                ConvertNames();
                TellChanges();
            }));
    }
    for (const char* szPath : {CDataPaths::ContactRecords(), CDataPaths::ContactReg(),
                               CDataPaths::PinyinMapping(), CDataPaths::PinyinSource()})
    {
        chmod(szPath, 0777);
    }
    chmod((m_directory.Root() + "/files").c_str(), 0777);
    EXPECT_EQ(DifferenceOf(ReadStore(), FreshBuild(m_directory.Root(), 0)), "")
        << "nobody without rights changed it";
    ExpectWorking();
}

// The store has to grow and cannot: the old index answers on, and the change is not forgotten.
TEST_F(CHostileTest, AFileSizeLimitKeepsTheOldIndex)
{
    Build();
    const std::string strBefore = RecordsFile();
    std::vector<tag_ProviderContact> vContacts;
    for (int i = 0; i < STORE_SPARE_RECORDS + 1; ++i)
    {
        tag_ProviderContact contact;
        contact.iId = 1000 + i;
        contact.strName = "Tom";
        vContacts.push_back(contact);
    }
    m_provider.PutAll(vContacts);
    EXPECT_TRUE(RunInChild(
        [&]
        {
            const rlimit limit = {strBefore.size(), strBefore.size()};
            ASSERT_EQ(setrlimit(RLIMIT_FSIZE, &limit), 0);
            long long llId = 1000;
            m_logic.OnContactsTableChanged(1, &llId);
            EXPECT_EQ(m_logic.MemInit(true), -1);
            EXPECT_EQ(Search("").Contacts().size(), static_cast<size_t>(CONTACTS));
        }));
    EXPECT_EQ(RecordsFile(), strBefore);
    EXPECT_EQ(Reg(), (tag_ContactReg{CONTACTS, 0, 0})) << "asks for a rebuild";
    m_logic.OnStatusUpdatesTableChanged(0, nullptr);
    EXPECT_EQ(Reg().iTotalNum, CONTACTS + STORE_SPARE_RECORDS + 1);
    EXPECT_EQ(DifferenceOf(ReadStore(), FreshBuild(m_directory.Root(), 0)), "");
}

TEST_F(CHostileTest, WorksWithoutStandardStreams)
{
    Build();
    m_provider.SetStarred(4, true);
    const int iStatus = StatusOfChild(
        [&]
        {
            close(STDIN_FILENO);
            close(STDOUT_FILENO);
            close(STDERR_FILENO);
            long long llId = 4;
            bool bRight = m_logic.MemInit(true) == 0;
            m_logic.OnContactsTableChanged(1, &llId);
            m_logic.OnContactTimeChanged(1, 77);
            m_logic.OnStatusUpdatesTableChanged(0, nullptr);
            bRight = bRight && Search("").Contacts().size() == CONTACTS;
            _exit(bRight ? 0 : 1);
        });
    EXPECT_EQ(iStatus, 0);
    m_provider.SetLastTime(1, 77);
    EXPECT_EQ(DifferenceOf(ReadStore(), FreshBuild(m_directory.Root(), 0)), "");
}

// --- The database ------------------------------------------------------------------------------

TEST_F(CHostileTest, AHostileDatabaseLeavesTheIndexAlone)
{
    Build();
    const std::string strDatabase = CDataDirectory::ReadBytes(CDataPaths::Database());
    const std::string strRecords = RecordsFile();
    const struct
    {
        const char* szWhat;
        std::function<void()> fnDamage;
    } cases[] = {
        {"no database", [] { fs::remove(CDataPaths::Database()); }},
        {"an empty file", [] { Damage(CDataPaths::Database(), ""); }},
        {"no database at all", [] { Damage(CDataPaths::Database(), RandomBytes(50'000, 9)); }},
        {"half a database",
         [&] { Damage(CDataPaths::Database(), strDatabase.substr(0, strDatabase.size() / 2)); }},
        {"no names", [] { CProviderDatabase().Execute("drop table localizer"); }},
        {"a contact without a name row",
         [] { CProviderDatabase().Execute("delete from localizer where contact_id=40"); }},
        {"no contacts",
         [] {
             CProviderDatabase().Execute(
                 "drop table contacts; create view contacts as select 1 as x");
         }},
    };
    for (const auto& row : cases)
    {
        SCOPED_TRACE(row.szWhat);
        row.fnDamage();
        CLocalizerLogic logic; // without a connection to the file that was there before
        EXPECT_EQ(logic.MemInit(true), -1);
        logic.OnContactsTableChanged();
        logic.OnStatusUpdatesTableChanged(0, nullptr);
        EXPECT_EQ(RecordsFile(), strRecords);
        EXPECT_EQ(Reg().iTotalNum, CONTACTS);
        EXPECT_EQ(Search("").Contacts().size(), static_cast<size_t>(CONTACTS));
        Damage(CDataPaths::Database(), strDatabase);
        CLocalizerLogic().OnStatusUpdatesTableChanged(0, nullptr);
        EXPECT_FALSE(IsMarked(Reg())) << "the change is made up for";
    }
}

// Whoever locks the database longer than the reader tries is in the way of a change, not of a
// search, and the next notification makes up for it.
TEST_F(CHostileTest, ALockedDatabaseIsMadeUpFor)
{
    Build();
    m_provider.Execute("begin exclusive");
    m_provider.SetStarred(7, true);
    long long llId = 7;
    m_logic.OnContactsTableChanged(1, &llId);
    EXPECT_EQ(m_logic.MemInit(true), -1);
    EXPECT_EQ(Search("").Contacts().size(), static_cast<size_t>(CONTACTS));
    EXPECT_EQ(Reg(), (tag_ContactReg{CONTACTS, 0, 0}));
    m_provider.Unlock();
    m_logic.OnStatusUpdatesTableChanged(0, nullptr);
    EXPECT_EQ(DifferenceOf(ReadStore(), FreshBuild(m_directory.Root(), 0)), "");
}

TEST_F(CHostileTest, AnyValuesInAnyColumn)
{
    const char* szValues[] = {"null",      "''",
                              "-1",        "9223372036854775807",
                              "1.5e300",   "'text'",
                              "x'00ff80'", "zeroblob(100000)",
                              "'1.-2..x'", "cast(x'f09f9880c3' as text)"};
    const char* szColumns[] = {"contacts set times_contacted",  "contacts set starred",
                               "contacts set has_phone_number", "contacts set last_time_contacted",
                               "contacts set single_is_secret", "contacts set status_update_id",
                               "localizer set display_name",    "localizer set localizerkey",
                               "localizer set group_id",        "localizer set account_id",
                               "localizer set hasMail",         "localizer set hasAddress"};
    int iValue = 0;
    for (const char* szColumn : szColumns)
    {
        for (int iId = 1; iId <= CONTACTS; ++iId)
        {
            m_provider.Execute(std::string("update ") + szColumn + "=" +
                               szValues[static_cast<size_t>(iValue++) % std::size(szValues)] +
                               " where " + (szColumn[0] == 'c' ? "_id" : "contact_id") + "=" +
                               std::to_string(iId));
        }
    }
    Build();
    for (const int iSortType : {0, 1})
    {
        m_logic.SetSortType(iSortType);
        m_logic.OnContactsTableChanged();
        std::vector<long long> vIds;
        for (int iId = 1; iId <= CONTACTS; ++iId)
        {
            vIds.push_back(iId);
        }
        m_logic.OnContactsTableChanged(CONTACTS, vIds.data());
        m_logic.OnStatusUpdatesTableChanged(0, nullptr);
        EXPECT_FALSE(IsMarked(Reg()));
        SearchEverywhere();
        EXPECT_EQ(Search("").Contacts().size(), static_cast<size_t>(CONTACTS));
    }
}

TEST_F(CHostileTest, AHundredThousandContacts)
{
    constexpr int MANY = 100'000;
    m_provider.Execute(
        "begin; with recursive n(i) as (select 1000 union all select i+1 from n where i<1000+" +
        std::to_string(MANY - CONTACTS - 1) +
        ") insert into contacts select i,0,0,1,i,0,0,0 from n;"
        "insert into visible_contacts select _id from contacts where _id>=1000;"
        "insert into localizer select _id,(select display_name from localizer where "
        "contact_id=1+_id%40),(select localizerkey from localizer where "
        "contact_id=1+_id%40),'1','1',0,0 from contacts where _id>=1000; commit");
    Build();
    EXPECT_EQ(Reg(), (tag_ContactReg{MANY, 0, MANY + STORE_SPARE_RECORDS}));
    m_provider.Remove(50'000);
    m_provider.SetName(60'000, "", "");
    m_provider.SetStarred(70'000, true);
    long long allIds[] = {50'000, 60'000, 70'000};
    m_logic.OnContactsTableChanged(3, allIds);
    EXPECT_EQ(Reg(), (tag_ContactReg{MANY - 1, 0, MANY + STORE_SPARE_RECORDS}));
    m_logic.OnStatusUpdatesTableChanged(0, nullptr);
    EXPECT_EQ(DifferenceOf(ReadStore(), FreshBuild(m_directory.Root(), 0)), "");
    EXPECT_EQ(Search("").Contacts().size(), static_cast<size_t>(MANY - 1));
}

} // namespace
