// The change handlers on real files. What a notification has to leave is mostly told by a second
// build from the same database.

#include "MemManager/MemManger.h"
#include "tests/Core/FacadeFixture.h"
#include "tests/Support/ChildProcess.h"

#include <algorithm>
#include <filesystem>
#include <functional>
#include <random>

namespace
{

using LongIds = std::vector<long long>;

constexpr long long FIRST_TIME = 1'600'000'000'000;
constexpr int CAPACITY = 8 + STORE_SPARE_RECORDS;

class CContactChangesTest : public CFacadeTest
{
protected:
    // Contacts 1 to 8 of every kind of name, last contacted in the order of their ids.
    void BuildStore(int iSortType = STORE_ORDER_NAME)
    {
        std::vector<tag_ProviderContact> vContacts;
        for (const char* szName : {"张安", "李四", "Tom", "王小明", "", "7-11", "阿明", "Anna"})
        {
            vContacts.push_back(Contact(static_cast<int>(vContacts.size()) + 1, szName));
        }
        Store(vContacts);
        ASSERT_EQ(m_logic.MemInit(true), 0);
        m_logic.SetSortType(iSortType);
        ASSERT_EQ(m_logic.MemInit(true), 0);
        m_log.Clear();
    }

    static tag_ProviderContact Contact(int iId, const std::string& strName)
    {
        tag_ProviderContact contact;
        contact.iId = iId;
        contact.strName = strName;
        contact.llLastTime = FIRST_TIME + iId % 20 * 1000LL;
        contact.iStatusId = 1000 + iId;
        return contact;
    }

    void Notify(LongIds vIds)
    {
        m_logic.OnContactsTableChanged(static_cast<int>(vIds.size()), vIds.data());
    }
    void NotifyStatus() { m_logic.OnStatusUpdatesTableChanged(0, nullptr); }

    static int SlotOf(int iId)
    {
        const Records vRecords = ReadStore().vRecords;
        int iSlot = static_cast<int>(vRecords.size()) - 1;
        while (iSlot >= 0 && vRecords[static_cast<size_t>(iSlot)].iContactID != iId)
        {
            --iSlot;
        }
        return iSlot;
    }
};

TEST_F(CContactChangesTest, TellsEachStepAndRenewsAContactInItsSlot)
{
    BuildStore(STORE_ORDER_TIME);
    tag_ProviderContact contact = Contact(4, "王小明");
    contact.bPhone = true;
    contact.llLastTime += 100'000; // told by no time notification: the slot stays all the same
    Store({contact});
    const size_t uSlot = static_cast<size_t>(SlotOf(4));
    m_log.Clear();
    Notify({4});
    NotifyStatus();
    m_logic.OnContactTimeChanged(999, 1);
    m_logic.OnContactStarChanged(999, 1);
    m_logic.OnContactsTableChanged(1, nullptr);
    long long llUnused = 0;
    m_logic.OnContactsTableChanged(0, &llUnused);
    const tag_ContactsStruct record = ReadStore().vRecords.at(uSlot);
    EXPECT_EQ(record.llLastTimeContacted, FIRST_TIME + 104'000);
    EXPECT_EQ(record.iFlags, CONTACT_FLAG_PHONE);
    EXPECT_EQ(record.iSortIndex, 4) << "its place by name";
    m_logic.OnContactsTableChanged();
    const std::string strAll = "[3 QV_Localize] QV_Contacts: OnContactsTable";
    const std::string strPatch = strAll + "Changed1 ";
    const std::string strPart = strAll + "PartChanged1 ";
    EXPECT_EQ(Told("QV_Contacts: On"),
              strPatch + "iRecordNum = 1\n" + strPatch +
                  "m_pclMemManger->GetMemSize; memSize = 1008 memContactsNum = 8" + strPatch +
                  "GetContactsCount = 8\n" + strPatch + "contactCount less than memSize, right!" +
                  strPatch + "old contact count = 8\n" + strPatch + "stRecord.RecordNum: 1" +
                  strPatch + "found same item, renew it k=0, stRecord.RecordNum=0" + strPart +
                  "find matchedNum=0, stRecord.RecordNum=0" + strPart + "EXIT takes ms" + strPatch +
                  "old contact count = 8\n" + strPatch + "iRecordNum = 0\n" + strAll +
                  "Changed  iSortType = 1\n" + strAll + "Changed stRecord.num = 8 \n");
    EXPECT_EQ(m_logic.OnGetSortType(), STORE_ORDER_TIME);
    Store({Contact(9, "阿")});
    Notify({9});
    EXPECT_EQ(ReadStore().vRecords.at(1).iSortIndex, 1) << "its slot in time order";
    ExpectFresh();
}

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
        const int iKind = Pick(4);
        if (SlotOf(iId) < 0)
        {
            Store({Contact(iId, strName)});
        }
        else if (iKind < 2)
        {
            iKind == 0 ? m_provider.Remove(iId) : m_provider.SetVisible(iId, false);
        }
        else
        {
            m_provider.SetStarred(iId, iKind == 2);
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
        NotifyStatus();
    }

    // A time, a star and an online state, also of contacts that are not stored.
    void ChangeOthers()
    {
        int iId = 1 + Pick(60);
        m_llNow += 1000;
        m_provider.SetLastTime(iId, m_llNow);
        m_logic.OnContactTimeChanged(iId, m_llNow);
        iId = 1 + Pick(60);
        const long lStarred = Pick(4) - 1; // only 1 marks a favourite
        m_provider.SetStarred(iId, lStarred == 1);
        m_logic.OnContactStarChanged(iId, lStarred);
        m_provider.SetOnline(1001 + Pick(60), Pick(2) == 0);
        NotifyStatus();
    }

    std::mt19937 m_random{20260401};
    long long m_llNow = FIRST_TIME + 1'000'000;
};

TEST_P(CAnyChanges, EndLikeAFreshBuild)
{
    BuildStore(GetParam());
    for (int iRound = 0; iRound < 60; ++iRound)
    {
        SCOPED_TRACE(iRound);
        Pick(2) == 0 ? ChangeOthers() : ChangeContacts();
        EXPECT_EQ(Reg().iMemSize, CAPACITY) << "patched, not rebuilt";
        ExpectFresh();
    }
}

INSTANTIATE_TEST_SUITE_P(Orders, CAnyChanges, testing::Values(STORE_ORDER_NAME, STORE_ORDER_TIME));

// Lists that the reader would cut or misread, and stores that cannot take the change.
TEST_F(CContactChangesTest, RebuildsWhereAPatchCannotDo)
{
    const struct
    {
        const char* szWhat;
        LongIds vIds;
        tag_ContactReg reg;
        bool bStatusToo; // a status notification rebuilds too
    } ROWS[] = {
        {"201 ids", LongIds(201, 9), {8, 0, CAPACITY}, false},
        {"200 long ids", LongIds(200, 1'000'000'000), {8, 0, CAPACITY}, false},
        {"an id beyond 32 bits", {(1LL << 32) + 9}, {8, 0, CAPACITY}, false},
        {"no room for the database", {9}, {8, 0, 8}, false},
        {"no capacity", {9}, {8, 0, 0}, true},
        {"more contacts than capacity", {9}, {8, 0, 7}, true},
        {"a writer died before it counted", {9}, {0, 0, 0}, true},
        {"a damaged record", {9}, {-1, 0, CAPACITY}, true},
        {"a record of a larger store", {9}, {5000, 0, 6000}, true},
    };
    for (const auto& row : ROWS)
    {
        for (int iStatus = 0; iStatus <= (row.bStatusToo ? 1 : 0); ++iStatus)
        {
            m_provider.Remove(9);
            BuildStore();
            Store({Contact(9, "新")});
            SetReg(row.reg);
            iStatus == 1 ? NotifyStatus() : Notify(row.vIds);
            ExpectFresh(row.szWhat);
            EXPECT_EQ(Reg(), (tag_ContactReg{9, 0, CAPACITY + 1})) << row.szWhat;
        }
    }
    // A contact that went without being told still takes the room of a new one.
    m_provider.Remove(1);
    Store({Contact(10, "旧")});
    SetReg({9, 0, 9});
    Notify({10});
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
        NotifyStatus();
        ExpectFresh();
    }
}

// Every handler waits for the lock, as long as it takes, with a line per attempt.
TEST_F(CContactChangesTest, WaitForTheLock)
{
    const std::pair<std::string, std::function<void()>> ROWS[] = {
        {"OnContactsTableChanged1", [this] { Notify({3}); }},
        {"OnContactsTableChanged1", [this] { NotifyStatus(); }},
        {"OnContactTimeChanged", [this] { m_logic.OnContactTimeChanged(999, 1); }},
        {"OnContactStarChanged", [this] { m_logic.OnContactStarChanged(999, 1); }},
    };
    BuildStore();
    for (const auto& [strHandler, fnCall] : ROWS)
    {
        const std::string strRefusal = "QV_Contacts: " + strHandler + " Lock share mem false";
        int iRefusals = 0;
        CLockHolder holder;
        m_log.AtEachLine(
            [&](const std::string& strText)
            {
                iRefusals += strText == strRefusal ? 1 : 0;
                if (iRefusals == 7)
                {
                    holder.Kill();
                }
            });
        fnCall();
        EXPECT_EQ(iRefusals, 7) << strHandler;
    }
    m_log.AtEachLine(nullptr);
    ExpectFresh();
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
    for (const int iSortType : {STORE_ORDER_NAME, STORE_ORDER_TIME})
    {
        for (const auto& row : ROWS)
        {
            BuildStore(iSortType);
            m_provider.Put(Contact(3, "Zoe"));
            m_log.AtEachLine(
                [&](const std::string& strText)
                {
                    if (strText.find(row.szLine) != std::string::npos)
                    {
                        CMemManger().SetSortType(1 - iSortType);
                    }
                });
            row.fnCall();
            m_log.AtEachLine(nullptr);
            EXPECT_EQ(Reg().iSortType, 1 - iSortType) << row.szLine;
            EXPECT_EQ(Reg().iMemSize == 0, row.bMarked) << row.szLine;
            Notify({3});
            ExpectFresh();
        }
    }
}

} // namespace
