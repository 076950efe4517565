// The change handlers on real files. What a notification has to leave is mostly told by a second
// build from the same database.

#include "MemManager/StoreCheck.h"
#include "Platform/LogSink.h"
#include "tests/Core/FacadeFixture.h"
#include "tests/Support/ChildProcess.h"
#include "tests/Support/MemoryFailure.h"
#include "tests/Support/StoreImage.h"

#include <algorithm>
#include <climits>
#include <fcntl.h>
#include <filesystem>
#include <functional>
#include <numeric>
#include <random>
#include <sys/file.h>
#include <unistd.h>

namespace
{

using Lines = std::vector<std::string>;

constexpr long long FIRST_TIME = 1'600'000'000'000;

// Kills the lock's holder after some lines of error priority, while a handler waits.
class CKillAfterRefusals
{
public:
    CKillAfterRefusals(CLockHolder& holder, const std::string& strLine, int iRefusals)
        : m_holder(holder), m_strLine(strLine), m_iLeft(iRefusals)
    {
        CLogSink::Set(&CKillAfterRefusals::Receive, this);
    }
    ~CKillAfterRefusals() { CLogSink::Set(nullptr, nullptr); }
    CKillAfterRefusals(const CKillAfterRefusals&) = delete;
    CKillAfterRefusals& operator=(const CKillAfterRefusals&) = delete;

    // Refusals less than expected, below 0 for more.
    int Left() const { return m_iLeft; }

private:
    static void Receive(void* pContext, int iPriority, const char* /*szTag*/, const char* szText)
    {
        auto* pThis = static_cast<CKillAfterRefusals*>(pContext);
        if (iPriority == ERROR_LINE && szText == pThis->m_strLine && --pThis->m_iLeft == 0)
        {
            pThis->m_holder.Kill();
        }
    }

    CLockHolder& m_holder;
    std::string m_strLine;
    int m_iLeft;
};

class CContactChangesTest : public CFacadeTest
{
protected:
    // Contacts 1 to 8 of every kind of name, last contacted in the order of their ids.
    void BuildStore(int iSortType = STORE_ORDER_NAME)
    {
        const std::vector<std::string> vNames = {"张安", "李四", "Tom",  "王小明",
                                                 "",     "7-11", "阿明", "Anna"};
        std::vector<tag_ProviderContact> vContacts;
        for (const std::string& strName : vNames)
        {
            const int iId = static_cast<int>(vContacts.size()) + 1;
            vContacts.push_back(Contact(iId, strName));
        }
        Store(vContacts);
        ASSERT_EQ(m_logic.MemInit(true), 0);
        if (iSortType != STORE_ORDER_NAME)
        {
            m_logic.SetSortType(iSortType);
            ASSERT_EQ(m_logic.MemInit(true), 0);
        }
        m_log.Clear();
    }

    static tag_ProviderContact Contact(int iId, const std::string& strName)
    {
        tag_ProviderContact contact;
        contact.iId = iId;
        contact.strName = strName;
        contact.llLastTime = FIRST_TIME + iId * 1000LL;
        contact.iStatusId = 1000 + iId;
        return contact;
    }

    void Rename(int iId, const std::string& strName)
    {
        m_provider.SetName(iId, strName, LocalizerKeyOf(strName));
    }

    void Notify(std::vector<long long> vIds)
    {
        m_logic.OnContactsTableChanged(static_cast<int>(vIds.size()), vIds.data());
    }

    void ExpectFresh(const std::string& strWhat = "")
    {
        const tag_StoreImage store = ReadStore();
        EXPECT_FALSE(IsMarked(store.reg)) << strWhat;
        EXPECT_EQ(DifferenceOf(store, FreshBuild(m_directory.Root(), store.reg.iSortType)), "")
            << strWhat;
    }

    static void ExpectLockFree()
    {
        const int iFd = open(CDataPaths::LockFile(), O_RDWR);
        EXPECT_EQ(flock(iFd, LOCK_EX | LOCK_NB), 0);
        close(iFd);
    }

    static void SetReg(const tag_ContactReg& reg)
    {
        CDataDirectory::WriteBytes(CDataPaths::ContactReg(),
                                   {reinterpret_cast<const char*>(&reg), sizeof(reg)});
    }

    // The handler's own lines, without those of the lock and the reader.
    Lines HandlerLines(int iPriority)
    {
        Lines vLines;
        for (const std::string& strText : m_log.Texts(iPriority))
        {
            if (strText.rfind("QV_Contacts: On", 0) == 0)
            {
                vLines.push_back(strText);
            }
        }
        return vLines;
    }

    int SlotOf(int iId)
    {
        const std::vector<tag_ContactsStruct> vRecords = ReadStore().vRecords;
        const auto it = std::find_if(vRecords.begin(), vRecords.end(),
                                     [iId](const auto& r) { return r.iContactID == iId; });
        return it == vRecords.end() ? -1 : static_cast<int>(it - vRecords.begin());
    }
};

TEST_F(CContactChangesTest, RenewsAContactInItsSlot)
{
    BuildStore(STORE_ORDER_TIME);
    const int iSlot = SlotOf(4);
    const tag_ContactsStruct before = StoredRecords(8)[static_cast<size_t>(iSlot)];
    tag_ProviderContact contact = Contact(4, "王小明");
    contact.bPhone = true;
    contact.strGroups = "3.9";
    contact.llLastTime += 100'000; // told by no time notification: the slot stays all the same
    Store({contact});
    m_log.Clear();
    Notify({4});
    EXPECT_EQ(Reg(), (tag_ContactReg{8, STORE_ORDER_TIME, 1008}));
    const tag_ContactsStruct after = StoredRecords(8)[static_cast<size_t>(iSlot)];
    EXPECT_EQ(after.iContactID, 4);
    EXPECT_EQ(after.iFlags, CONTACT_FLAG_PHONE);
    EXPECT_EQ(after.lGroupID[1], 9);
    EXPECT_EQ(after.iSortIndex, before.iSortIndex);
    EXPECT_EQ(after.llLastTimeContacted, contact.llLastTime);
    const std::string strPatch = "QV_Contacts: OnContactsTableChanged1 ";
    const std::string strPart = "QV_Contacts: OnContactsTablePartChanged1 ";
    const Lines vExpected = {
        strPatch + "iRecordNum = 1\n",
        strPatch + "m_pclMemManger->GetMemSize; memSize = 1008 memContactsNum = 8",
        strPatch + "GetContactsCount = 8\n",
        strPatch + "contactCount less than memSize, right!",
        strPatch + "old contact count = 8\n",
        strPatch + "stRecord.RecordNum: 1",
        strPatch + "found same item, renew it k=0, stRecord.RecordNum=0",
        strPart + "find matchedNum=0, stRecord.RecordNum=0",
        strPart + "EXIT takes ",
    };
    Lines vLines = HandlerLines(DEBUG_LINE);
    ASSERT_FALSE(vLines.empty());
    vLines.back().resize(vExpected.back().size()); // without the milliseconds
    EXPECT_EQ(vLines, vExpected);
    EXPECT_TRUE(m_log.Texts(ERROR_LINE).empty());
}

class CPatch : public CContactChangesTest, public testing::WithParamInterface<int>
{
};

// After any change the store is the one that a build from the database makes, in both orders.
TEST_P(CPatch, EndsLikeAFreshBuild)
{
    const std::vector<std::pair<std::string, std::function<std::vector<long long>()>>> vChanges = {
        {"a contact goes",
         [this]
         {
             m_provider.Remove(3);
             return std::vector<long long>{3};
         }},
        {"a contact is hidden",
         [this]
         {
             m_provider.SetVisible(1, false);
             return std::vector<long long>{1};
         }},
        {"and shown again",
         [this]
         {
             m_provider.SetVisible(1, true);
             return std::vector<long long>{1};
         }},
        {"a name becomes another",
         [this]
         {
             Rename(2, "赵六");
             return std::vector<long long>{2};
         }},
        {"a name goes",
         [this]
         {
             Rename(4, "");
             return std::vector<long long>{4};
         }},
        {"a nameless contact gets a name",
         [this]
         {
             Rename(5, "张");
             return std::vector<long long>{5};
         }},
        {"contacts appear in front, between and behind",
         [this]
         {
             Store({Contact(20, "a"), Contact(21, "毛毛"), Contact(22, "")});
             return std::vector<long long>{20, 21, 22};
         }},
        {"the renamed contact is renewed, not inserted again",
         [this]
         {
             m_provider.SetStarred(2, true);
             return std::vector<long long>{2};
         }},
        {"everything at once, with an unknown id and one named twice",
         [this]
         {
             m_provider.Remove(20);
             Rename(21, "#1");
             m_provider.SetStarred(6, true);
             Store({Contact(30, "張三"), Contact(31, "Zoe")});
             return std::vector<long long>{777, 31, 20, 6, 21, 30, 20};
         }},
        {"nothing",
         [] {
             return std::vector<long long>{1, 2, 22};
         }},
    };
    BuildStore(GetParam());
    for (const auto& [strWhat, fnChange] : vChanges)
    {
        const std::vector<long long> vIds = fnChange();
        m_log.Clear();
        Notify(vIds);
        EXPECT_TRUE(m_log.Texts(ERROR_LINE).empty()) << strWhat;
        EXPECT_EQ(Reg().iMemSize, 1008) << strWhat << ": patched, not rebuilt";
        ExpectFresh(strWhat);
    }
    ExpectLockFree();
}

INSTANTIATE_TEST_SUITE_P(Orders, CPatch, testing::Values(STORE_ORDER_NAME, STORE_ORDER_TIME));

// Random changes of many contacts with many equal names.
TEST_P(CPatch, EndsLikeAFreshBuildAfterAnyChanges)
{
    const unsigned int uSeed = 20260401;
    SCOPED_TRACE("seed " + std::to_string(uSeed));
    std::mt19937 random(uSeed);
    const auto Pick = [&random](int iNum) { return static_cast<int>(random() % unsigned(iNum)); };
    const std::vector<std::string> vNames = {"张三", "张山", "zhang", "Tom", "tom",  "",
                                             "9",    "李",   "重庆",  "#",   "李Lee"};
    BuildStore(GetParam());
    for (int iRound = 0; iRound < 15; ++iRound)
    {
        std::vector<long long> vIds;
        for (int i = Pick(12); i >= 0; --i)
        {
            const int iId = 1 + Pick(60);
            if (std::find(vIds.begin(), vIds.end(), iId) != vIds.end())
            {
                continue;
            }
            vIds.push_back(iId);
            const bool bStored = SlotOf(iId) >= 0;
            const std::string& strName = vNames[static_cast<size_t>(Pick(11))];
            if (!bStored)
            {
                Store({Contact(iId, strName)});
            }
            else if (Pick(3) == 0)
            {
                m_provider.Remove(iId);
            }
            else if (Pick(2) == 0)
            {
                Rename(iId, strName);
            }
            else
            {
                m_provider.SetStarred(iId, Pick(2) == 0);
            }
        }
        Notify(vIds);
        ExpectFresh("round " + std::to_string(iRound));
    }
}

// The slot of an inserted record in a store in time order is its iSortIndex.
TEST_F(CContactChangesTest, NumbersAnInsertedRecordBySlotInTimeOrder)
{
    BuildStore(STORE_ORDER_TIME);
    tag_ProviderContact contact = Contact(9, "阿");
    contact.llLastTime = FIRST_TIME + 3500;
    Store({contact});
    const std::vector<tag_ContactsStruct> vBefore = StoredRecords(8);
    Notify({9});
    EXPECT_EQ(SlotOf(9), 5);
    const std::vector<tag_ContactsStruct> vAfter = StoredRecords(9);
    EXPECT_EQ(vAfter[5].iSortIndex, 5);
    for (size_t i = 0; i < 8; ++i)
    {
        EXPECT_EQ(vAfter[i + (i >= 5 ? 1 : 0)].iSortIndex, vBefore[i].iSortIndex) << i;
    }
}

TEST_F(CContactChangesTest, UsesTheListUp)
{
    BuildStore();
    std::vector<long long> vIds = {50, 3, 51, 4};
    const int iSlot3 = SlotOf(3);
    ASSERT_LT(iSlot3, SlotOf(4)) << "3 is met first";
    m_logic.OnContactsTableChanged(4, vIds.data());
    EXPECT_EQ(vIds, (std::vector<long long>{50, 51, 51, 4}))
        << "4 into 3's place, then 51 into 4's";
}

TEST_F(CContactChangesTest, DoesNothingWithoutIds)
{
    BuildStore();
    const std::string strBefore = RecordsFile();
    m_provider.Remove(1);
    long long llId = 1;
    m_logic.OnContactsTableChanged(1, nullptr);
    EXPECT_TRUE(m_log.Lines().empty());
    for (const int iCount : {0, -1, INT_MIN})
    {
        m_log.Clear();
        m_logic.OnContactsTableChanged(iCount, &llId);
        EXPECT_EQ(m_log.Texts(DEBUG_LINE),
                  (Lines{"QV_Contacts: OnContactsTableChanged1 iRecordNum = " +
                         std::to_string(iCount) + "\n"}));
    }
    EXPECT_EQ(RecordsFile(), strBefore);
    EXPECT_EQ(Reg(), (tag_ContactReg{8, 0, 1008}));
}

// Lists that the reader would cut or misread, and stores that cannot take the change.
TEST_F(CContactChangesTest, RebuildsWhereAPatchCannotDo)
{
    const auto Many = [](int iNum, long long llFirst)
    {
        std::vector<long long> vIds(static_cast<size_t>(iNum));
        std::iota(vIds.begin(), vIds.end(), llFirst);
        return vIds;
    };
    const struct
    {
        const char* szWhat;
        std::vector<long long> vIds;
        tag_ContactReg reg;
    } cases[] = {
        {"201 ids", Many(201, 1), {8, 0, 1008}},
        {"200 long ids", Many(200, 1'000'000'000), {8, 0, 1008}},
        {"an id beyond 32 bits", {(1LL << 32) + 9}, {8, 0, 1008}},
        {"no capacity", {9}, {8, 0, 0}},
        {"more contacts than capacity", {9}, {8, 0, 7}},
        {"no room for the database", {9}, {8, 0, 8}},
        {"a damaged record", {9}, {-1, 0, 1008}},
        {"a record of a larger store", {9}, {5000, 0, 6000}},
    };
    for (const auto& row : cases)
    {
        m_provider.Remove(9);
        BuildStore();
        Store({Contact(9, "新")});
        SetReg(row.reg);
        m_log.Clear();
        Notify(row.vIds);
        ExpectFresh(row.szWhat);
        EXPECT_EQ(Reg(), (tag_ContactReg{9, 0, 1009})) << row.szWhat;
        EXPECT_TRUE(m_log.Has(DEBUG_LINE, "QV_Contacts: OnContactsTableChanged  iSortType = 0\n"));
        EXPECT_TRUE(
            m_log.Has(DEBUG_LINE, "QV_Contacts: OnContactsTableChanged stRecord.num = 9 \n"));
        EXPECT_FALSE(m_log.Has(DEBUG_LINE, "QV_Contacts: OnContactsTableChanged1 old contact count "
                                           "= 8\n"))
            << row.szWhat << ": no patch was begun";
    }
}

TEST_F(CContactChangesTest, RebuildsWhenTheStoreFillsUpUnexpectedly)
{
    BuildStore();
    SetReg({8, 0, 8});
    m_provider.Remove(1); // not told
    Store({Contact(9, "新")});
    Notify({9});
    ExpectFresh();
    EXPECT_EQ(Reg().iMemSize, 1008);
    EXPECT_TRUE(m_log.Has(DEBUG_LINE, "QV_Contacts: OnContactsTableChanged1 old contact count = "
                                      "8\n"))
        << "the patch was begun";
}

TEST_F(CContactChangesTest, RebuildsInTheOrderThatWasSet)
{
    BuildStore();
    for (const int iSortType : {STORE_ORDER_TIME, STORE_ORDER_NAME, 7})
    {
        m_logic.SetSortType(iSortType);
        EXPECT_EQ(Reg(), (tag_ContactReg{8, iSortType, 0}));
        Notify({1});
        EXPECT_EQ(Reg(), (tag_ContactReg{8, iSortType, 1008}));
        EXPECT_EQ(m_logic.OnGetSortType(), iSortType);
        EXPECT_EQ(SlotOf(8), iSortType == STORE_ORDER_TIME ? 0 : SlotOf(8));
        ExpectFresh();
    }
}

// A contact that was not told leaves the counts apart: the store takes the database's count, with
// cleared slots where it has no record, and asks for a rebuild.
TEST_F(CContactChangesTest, MarksAStoreThatMissesContacts)
{
    BuildStore();
    Store({Contact(9, "新"), Contact(10, "旧"), Contact(11, "闲")});
    Notify({9});
    EXPECT_EQ(Reg(), (tag_ContactReg{11, 0, 0}));
    const std::string strUncovered =
        RecordsFile().substr(9 * sizeof(tag_ContactsStruct), 2 * sizeof(tag_ContactsStruct));
    EXPECT_EQ(strUncovered, std::string(strUncovered.size(), '\0'));
    m_logic.OnStatusUpdatesTableChanged(0, nullptr);
    ExpectFresh();
}

TEST_F(CContactChangesTest, MarksAStoreWhoseChangeFailed)
{
    BuildStore();
    m_provider.Execute("insert into contacts(_id) values(9)"); // without a name row
    m_provider.SetVisible(9, true);
    Notify({9});
    EXPECT_EQ(Reg(), (tag_ContactReg{9, 0, 0}));
    EXPECT_TRUE(
        m_log.Has(ERROR_LINE, "QV_Contacts: OnContactsTableChanged1 ReadAllLocalizer = -1\n"));
    ExpectLockFree();

    Store({Contact(9, "新")});
    std::filesystem::remove(CDataPaths::PinyinMapping());
    SetReg({8, 0, 1008});
    Notify({9});
    EXPECT_EQ(Reg(), (tag_ContactReg{9, 0, 0})) << "names cannot be converted";
    ExpectLockFree();
    Notify({9});
    EXPECT_EQ(Reg(), (tag_ContactReg{9, 0, 0})) << "the rebuild neither";

    ASSERT_EQ(CQVLocalizerManager::InitMapFile(), 0);
    m_logic.OnStatusUpdatesTableChanged(0, nullptr);
    ExpectFresh();
}

TEST_F(CContactChangesTest, SurvivesWhateverAllocationFails)
{
    BuildStore();
    int iFailures = 1;
    for (int iGranted = 0; iFailures > 0; ++iGranted)
    {
        ASSERT_LT(iGranted, 1000);
        Rename(2, iGranted % 2 == 0 ? "A" : "张");
        {
            CMemoryFailure failure(iGranted);
            Notify({2});
            iFailures = failure.Failures();
        }
        ExpectLockFree();
        EXPECT_TRUE(IsMarked(Reg()) || iFailures == 0 || SlotOf(2) >= 0);
        m_logic.OnContactsTableChanged();
        ExpectFresh("allocation " + std::to_string(iGranted));
    }
}

// A change that could not be written at all is not forgotten.
TEST_F(CContactChangesTest, MarksAStoreThatCouldNotBeRebuilt)
{
    BuildStore();
    m_provider.Remove(1);
    {
        CLockHolder holder;
        m_logic.OnContactsTableChanged();
    }
    EXPECT_TRUE(
        m_log.Has(ERROR_LINE, "QV_Contacts:InitContactRecord write share memo lock false return"));
    EXPECT_EQ(Reg(), (tag_ContactReg{8, 0, 0}));
    m_logic.OnStatusUpdatesTableChanged(0, nullptr);
    ExpectFresh();
}

TEST_F(CContactChangesTest, BuildsAStoreThatIsMissing)
{
    BuildStore();
    for (const bool bStatus : {false, true})
    {
        std::filesystem::remove(CDataPaths::ContactReg());
        std::filesystem::remove(CDataPaths::ContactRecords());
        if (bStatus)
        {
            m_logic.OnStatusUpdatesTableChanged(0, nullptr);
        }
        else
        {
            Notify({1});
        }
        ExpectFresh();
    }
}

TEST_F(CContactChangesTest, FollowsWhoIsOnline)
{
    BuildStore();
    const auto Online = [this]
    {
        Ids vIds;
        for (const tag_ContactsStruct& record : ReadStore().vRecords)
        {
            if ((record.iFlags & CONTACT_FLAG_ONLINE) != 0)
            {
                vIds.push_back(record.iContactID);
            }
        }
        std::sort(vIds.begin(), vIds.end());
        return vIds;
    };
    m_provider.SetOnline(1002, true);
    m_provider.SetOnline(1005, true);
    m_logic.OnStatusUpdatesTableChanged(3, nullptr);
    EXPECT_EQ(Online(), (Ids{2, 5}));
    m_provider.SetOnline(1002, false);
    m_provider.SetOnline(1008, true);
    m_log.Clear();
    m_logic.OnStatusUpdatesTableChanged(0, nullptr);
    EXPECT_EQ(Online(), (Ids{5, 8}));
    EXPECT_EQ(HandlerLines(DEBUG_LINE),
              (Lines{"QV_Contacts: OnContactsTableChanged1 old contact count = 8\n"}));
    EXPECT_EQ(Reg(), (tag_ContactReg{8, 0, 1008}));
    m_provider.Execute("drop table status_updates");
    m_logic.OnStatusUpdatesTableChanged(0, nullptr);
    EXPECT_EQ(Online(), (Ids{5, 8})) << "nobody knows better";
    EXPECT_EQ(Reg(), (tag_ContactReg{8, 0, 1008}));
    ExpectLockFree();
}

TEST_F(CContactChangesTest, StatusRebuildsAStoreWithoutCapacity)
{
    BuildStore();
    // The last one: a writer died before it counted the first contact.
    for (const tag_ContactReg& reg : {tag_ContactReg{8, 0, 7}, {8, 0, 0}, {0, 0, 0}, {-3, 0, 9}})
    {
        SetReg(reg);
        m_logic.OnStatusUpdatesTableChanged(0, nullptr);
        ExpectFresh();
    }
    for (int iId = 1; iId <= 8; ++iId)
    {
        m_provider.Remove(iId);
    }
    SetReg({0, 1, 0});
    m_logic.OnStatusUpdatesTableChanged(0, nullptr);
    EXPECT_EQ(Reg(), (tag_ContactReg{0, 1, 0})) << "no contacts to be sorted";
}

TEST_F(CContactChangesTest, TakesTheTimeOfLastContact)
{
    BuildStore();
    tag_ContactsStruct expected = StoredRecords(8)[static_cast<size_t>(SlotOf(2))];
    const int iSlot = SlotOf(2);
    m_logic.OnContactTimeChanged(2, FIRST_TIME + 99'000);
    expected.llLastTimeContacted = FIRST_TIME + 99'000;
    expected.iTimesContacted = 1;
    EXPECT_EQ(
        std::memcmp(&StoredRecords(8)[static_cast<size_t>(iSlot)], &expected, sizeof(expected)), 0)
        << "in its slot, and nothing else";
    m_provider.SetLastTime(2, FIRST_TIME + 99'000);
    ExpectFresh();

    m_logic.SetSortType(STORE_ORDER_TIME);
    m_logic.OnContactsTableChanged();
    for (const int iId : {1, 4, 4, 7})
    {
        const std::vector<tag_ContactsStruct> vBefore = StoredRecords(8);
        const int iBefore = SlotOf(iId);
        const long long llTime = FIRST_TIME + 100'000 + iId;
        m_provider.SetLastTime(iId, llTime);
        m_logic.OnContactTimeChanged(iId, llTime);
        EXPECT_EQ(SlotOf(iId), 0);
        EXPECT_EQ(StoredRecords(1)[0].iSortIndex, vBefore[static_cast<size_t>(iBefore)].iSortIndex);
        EXPECT_EQ(Reg(), (tag_ContactReg{8, 1, 1008}));
        ExpectFresh();
    }
    const std::string strBefore = RecordsFile();
    m_logic.OnContactTimeChanged(99, 1);
    m_logic.OnContactTimeChanged(static_cast<long>((1LL << 32) + 1), 1);
    EXPECT_EQ(RecordsFile(), sizeof(long) > 4 ? strBefore : RecordsFile());
    ExpectLockFree();
}

TEST_F(CContactChangesTest, SetsAndClearsFavourites)
{
    BuildStore();
    const size_t uSlot = static_cast<size_t>(SlotOf(6));
    const tag_ContactsStruct before = StoredRecords(8)[uSlot];
    for (const long lStarred : {1L, 1L, 2L, 1L, 0L, 1L, -1L})
    {
        m_logic.OnContactStarChanged(6, lStarred);
        tag_ContactsStruct after = StoredRecords(8)[uSlot];
        EXPECT_EQ(after.iFlags, lStarred == 1 ? CONTACT_FLAG_STARRED : 0);
        after.iFlags = before.iFlags;
        EXPECT_EQ(std::memcmp(&after, &before, sizeof(after)), 0);
    }
    m_logic.OnContactStarChanged(99, 1);
    ExpectFresh();
    ExpectLockFree();
}

// Times and stars repair nothing and touch nothing that is not a store.
TEST_F(CContactChangesTest, TimesAndStarsLeaveOtherStoresAlone)
{
    BuildStore();
    const std::string strRecords = RecordsFile();
    for (const tag_ContactReg& reg :
         {tag_ContactReg{0, 1, 1000}, {-8, 1, 1008}, {8, 1, -1}, {5000, 1, 5000}, {8, 1, 99999}})
    {
        SetReg(reg);
        m_logic.OnContactTimeChanged(1, 5);
        m_logic.OnContactStarChanged(1, 1);
        EXPECT_EQ(Reg(), reg);
        EXPECT_EQ(RecordsFile(), strRecords);
        ExpectLockFree();
    }
    std::filesystem::remove(CDataPaths::ContactReg());
    m_logic.OnContactTimeChanged(1, 5);
    m_logic.OnContactStarChanged(1, 1);
    EXPECT_EQ(m_logic.OnGetSortType(), 0);
    EXPECT_FALSE(CDataDirectory::Exists(CDataPaths::ContactReg()));
}

TEST_F(CContactChangesTest, AMarkStaysAMark)
{
    BuildStore();
    SetReg({8, STORE_ORDER_TIME, 0});
    m_logic.OnContactTimeChanged(1, FIRST_TIME + 50'000);
    EXPECT_EQ(SlotOf(1), 0);
    EXPECT_EQ(Reg(), (tag_ContactReg{8, STORE_ORDER_TIME, 0}));
}

// Every handler waits for the lock, as long as it takes, with a line per attempt.
TEST_F(CContactChangesTest, WaitForTheLock)
{
    BuildStore();
    m_provider.SetStarred(3, true);
    const struct
    {
        const char* szLine;
        std::function<void()> fnCall;
    } cases[] = {
        {"QV_Contacts: OnContactsTableChanged1 Lock share mem false", [this] { Notify({3}); }},
        {"QV_Contacts: OnContactsTableChanged1 Lock share mem false",
         [this] { m_logic.OnStatusUpdatesTableChanged(0, nullptr); }},
        {"QV_Contacts: OnContactTimeChanged Lock share mem false",
         [this] { m_logic.OnContactTimeChanged(999, 1); }},
        {"QV_Contacts: OnContactStarChanged Lock share mem false",
         [this] { m_logic.OnContactStarChanged(999, 1); }},
    };
    for (const auto& row : cases)
    {
        CLockHolder holder;
        const CKillAfterRefusals refusals(holder, row.szLine, 7);
        row.fnCall();
        EXPECT_EQ(refusals.Left(), 0) << row.szLine;
        ExpectLockFree();
    }
    ExpectFresh();
}

} // namespace
