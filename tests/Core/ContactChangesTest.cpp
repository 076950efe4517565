// The change handlers on real files. What a notification has to leave is mostly told by a second
// build from the same database.

#include "MemManager/MemManger.h"
#include "tests/Core/FacadeFixture.h"
#include "tests/Support/ChildProcess.h"

#include <filesystem>
#include <functional>
#include <random>

namespace
{

using LongIds = std::vector<long long>;

constexpr int CAPACITY = 8 + STORE_SPARE_RECORDS;

class CContactChangesTest : public CFacadeTest
{
protected:
    // Contacts 1 to 8 of every kind of name, last contacted in the order of their ids.
    void BuildStore(int iSortType = STORE_ORDER_NAME)
    {
        SetReg({0, iSortType, 0});
        BuildNames({"张安", "李四", "Tom", "王小明", "", "7-11", "阿明", "Anna"});
    }

    void Notify(LongIds vIds)
    {
        m_logic.OnContactsTableChanged(static_cast<int>(vIds.size()), vIds.data());
    }
};

// Random changes of many contacts with many equal names and times, told by every handler.
class CAnyChanges : public CContactChangesTest, public testing::WithParamInterface<int>
{
protected:
    int Pick(int iNum) { return static_cast<int>(m_random() % static_cast<unsigned int>(iNum)); }

    void ChangeInDatabase(int iId)
    {
        const char* szNames[] = {"张三", "张山", "zhang", "Tom",  "tom",
                                 "",     "9",    "重庆",  "張三", "李Lee"};
        const std::string strName = szNames[Pick(10)];
        switch (Pick(5))
        {
        case 0:
            return m_provider.Remove(iId);
        case 1:
            return m_provider.SetVisible(iId, false);
        case 2:
            return Store({Contact(iId, strName)});
        default:
            m_provider.SetStarred(iId, Pick(2) == 0);
            m_provider.SetName(iId, strName, LocalizerKeyOf(strName));
        }
    }

    // The patch knows nobody's online state, which the status notification behind it brings.
    void ChangeContacts()
    {
        LongIds vIds = {777};
        for (int i = Pick(12); i >= 0; --i)
        {
            vIds.push_back(1 + Pick(60));
            ChangeInDatabase(static_cast<int>(vIds.back()));
        }
        Notify(vIds);
        EXPECT_FALSE(IsMarked(Reg()));
    }

    // A time, a star and an online state, also of contacts that are not stored.
    void ChangeOthers()
    {
        int iId = 1 + Pick(60);
        for (int i = 0; i < 2; ++i) // the second time at the start of the order by time
        {
            m_llNow += 1000;
            m_provider.SetLastTime(iId, m_llNow);
            m_logic.OnContactTimeChanged(iId, m_llNow);
        }
        iId = 1 + Pick(60);
        const long lStarred = Pick(4) - 1; // only 1 marks a favourite
        m_provider.SetStarred(iId, lStarred == 1);
        m_logic.OnContactStarChanged(iId, lStarred);
        m_provider.SetOnline(1001 + Pick(60), Pick(2) == 0);
    }

    std::mt19937 m_random{20260401};
    long long m_llNow = FIRST_TIME + 1'000'000;
};

TEST_P(CAnyChanges, EndLikeAFreshBuild)
{
    BuildStore(GetParam());
    for (int iRound = 0; iRound < 80; ++iRound)
    {
        SCOPED_TRACE(iRound);
        Pick(2) == 0 ? ChangeOthers() : ChangeContacts();
        m_logic.OnStatusUpdatesTableChanged(0, nullptr);
        EXPECT_EQ(Reg().iMemSize, CAPACITY) << "patched, not rebuilt";
        ExpectFresh();
    }
}

INSTANTIATE_TEST_SUITE_P(Orders, CAnyChanges, testing::Values(STORE_ORDER_NAME, STORE_ORDER_TIME));

// Who keeps his name keeps his slot, whatever else the database tells.
TEST_F(CContactChangesTest, RenewsAContactInItsSlot)
{
    BuildStore(STORE_ORDER_TIME);
    const Records vBefore = ReadStore().vRecords;
    tag_DatabaseContact contact = Contact(4, "王小明");
    contact.bPhone = true;
    contact.llLastTimeContacted += 100'000; // told by no time notification
    Store({contact});
    Notify({4});
    const tag_ContactsStruct record = ReadStore().vRecords.at(4);
    EXPECT_EQ(vBefore.at(4).iContactID, 4);
    EXPECT_EQ(record.llLastTimeContacted, contact.llLastTimeContacted);
    EXPECT_EQ(record.iFlags, CONTACT_FLAG_PHONE);
    EXPECT_EQ(record.iSortIndex, vBefore.at(4).iSortIndex) << "its place by name";
}

// Lists that the reader would cut or misread, and stores that cannot take the change.
TEST_F(CContactChangesTest, RebuildsWhereAPatchCannotDo)
{
    std::vector<std::pair<LongIds, tag_ContactReg>> vRows = {
        {LongIds(201, 9), {8, 0, CAPACITY}},
        {LongIds(200, 1'000'000'000), {8, 0, CAPACITY}}, // too long a text
        {{(1LL << 32) + 9}, {8, 0, CAPACITY}},
        {{9}, {8, 0, 8}}, // no room for the database
    };
    // No capacity, more contacts than that, a writer that died before it counted, a damaged record
    // and that of a larger store.
    for (const tag_ContactReg& reg : std::initializer_list<tag_ContactReg>{
             {8, 0, 0}, {8, 0, 7}, {0, 0, 0}, {-1, 0, CAPACITY}, {5000, 0, 6000}})
    {
        vRows.push_back({{9}, reg});
        vRows.push_back({{}, reg}); // a status notification
    }
    for (const auto& [vIds, reg] : vRows)
    {
        SCOPED_TRACE(testing::PrintToString(vIds) + testing::PrintToString(reg.iTotalNum));
        m_provider.Remove(9);
        BuildStore();
        Store({Contact(9, "新")});
        SetReg(reg);
        vIds.empty() ? m_logic.OnStatusUpdatesTableChanged(0, nullptr) : Notify(vIds);
        ExpectFresh();
        EXPECT_EQ(Reg(), (tag_ContactReg{9, 0, CAPACITY + 1}));
    }
    // A contact that went without being told still takes the room of a new one.
    m_provider.Remove(1);
    Store({Contact(10, "旧")});
    SetReg({9, 0, 9});
    Notify({10});
    ExpectFresh();
}

TEST_F(CContactChangesTest, KnowTheSmallestStores)
{
    m_logic.OnStatusUpdatesTableChanged(0, nullptr);
    EXPECT_FALSE(std::filesystem::exists(CDataPaths::ContactReg())) << "nobody to build for";
    BuildNames({"张"});
    SetReg({1, 0, 1});
    m_logic.OnStatusUpdatesTableChanged(0, nullptr);
    EXPECT_EQ(Reg(), (tag_ContactReg{1, 0, 1})) << "full, not marked";
    m_provider.Remove(1);
    SetReg({1, 0, 0});
    m_logic.OnStatusUpdatesTableChanged(0, nullptr);
    EXPECT_EQ(Reg(), (tag_ContactReg{0, 0, STORE_SPARE_RECORDS})) << "everybody has gone";
    // What a rebuild leaves behind the last record is nobody's any more.
    BuildNames({"张", "李"});
    m_provider.Remove(1);
    m_logic.OnContactsTableChanged();
    Store({Contact(1, "张")});
    Notify({1});
    ExpectFresh();
}

// A change that could not be written is not forgotten: the next notification makes up for it.
TEST_F(CContactChangesTest, MarksAStoreWhoseChangeFailed)
{
    std::unique_ptr<CLockHolder> holder;
    const struct
    {
        const char* szWhat;
        size_t uIds;
        int iTotalNum; // counted afterwards
        std::function<void()> fnBreak;
        std::function<void()> fnRepair;
    } ROWS[] = {
        {"no name row", 1, 9,
         [this] { m_provider.Execute("delete from localizer where contact_id=9"); },
         [this] { Store({Contact(9, "新")}); }},
        {"contacts were not told", 1, 10, [this] { Store({Contact(10, "旧")}); },
         [this] { m_provider.Remove(10); }},
        {"the lock is held through a rebuild", 201, 8,
         [&] { holder = std::make_unique<CLockHolder>(); }, [&] { holder.reset(); }},
    };
    for (const auto& row : ROWS)
    {
        SCOPED_TRACE(row.szWhat);
        m_provider.Remove(9);
        BuildStore();
        Store({Contact(9, "新")});
        row.fnBreak();
        Notify(LongIds(row.uIds, 9));
        EXPECT_EQ(Reg(), (tag_ContactReg{row.iTotalNum, 0, 0}));
        EXPECT_EQ(ReadStore().vRecords.back().iContactID == 0, row.iTotalNum > 8) << "cleared";
        row.fnRepair();
        m_logic.OnStatusUpdatesTableChanged(0, nullptr);
        ExpectFresh();
    }
}

// Every handler waits for the lock, as long as it takes, with a line per attempt. Those that may
// rebuild do so where another process has marked the store meanwhile.
TEST_F(CContactChangesTest, WaitForTheLock)
{
    const std::pair<std::string, std::function<void()>> ROWS[] = {
        {"OnContactsTableChanged1", [this] { Notify({3}); }},
        {"OnContactsTableChanged1", [this] { m_logic.OnStatusUpdatesTableChanged(0, nullptr); }},
        {"OnContactTimeChanged", [this] { m_logic.OnContactTimeChanged(999, 1); }},
        {"OnContactStarChanged", [this] { m_logic.OnContactStarChanged(999, 1); }},
    };
    BuildStore();
    for (const auto& row : ROWS)
    {
        CLockHolder holder;
        const bool bMayRebuild = row.first == "OnContactsTableChanged1";
        int iRefusals = 0;
        m_log.AtLinesWith("QV_Contacts: " + row.first + " Lock share mem false",
                          [&]
                          {
                              if (++iRefusals == 7)
                              {
                                  SetReg({8, 0, bMayRebuild ? 7 : CAPACITY});
                                  holder.Release();
                              }
                          });
        row.second();
        m_log.AtEachLine(nullptr);
        EXPECT_EQ(iRefusals, 7) << row.first;
        ExpectFresh();
    }
}

// Another caller sets the sort type while a change is under way: at the line that tells of the
// step before the last. A build sorts anew; a patch leaves the mark.
TEST_F(CContactChangesTest, NoticesASortTypeThatIsSetMeanwhile)
{
    const struct
    {
        const char* szLine;
        std::function<void()> fnCall;
        bool bMarked;
    } ROWS[] = {
        {"IFL_PtrQuickSort", [this] { m_logic.MemInit(true); }, false},
        {"stRecord.num", [this] { m_logic.OnContactsTableChanged(); }, false},
        {"find matchedNum", [this] { Notify({3}); }, true},
    };
    for (int i = 0; i < 6; ++i)
    {
        const auto& row = ROWS[i / 2];
        const int iSortType = i % 2;
        BuildStore(1 - iSortType);
        Store({Contact(3, "Zoe")});
        m_log.AtLinesWith(row.szLine, [&] { CMemManger().SetSortType(iSortType); });
        row.fnCall();
        m_log.AtEachLine(nullptr);
        EXPECT_EQ(Reg().iSortType, iSortType) << row.szLine;
        EXPECT_EQ(Reg().iMemSize == 0, row.bMarked) << row.szLine;
        Notify({3});
        ExpectFresh();
    }
}

} // namespace
