// Building the index: what it says and what it writes; and the log of all operations.

#include "tests/Core/FacadeFixture.h"
#include "tests/Support/ChildProcess.h"

#include <filesystem>
#include <regex>
#include <sstream>

namespace
{

class CMemInitTest : public CFacadeTest
{
protected:
    // Two contacts whose order differs by id and by name.
    void StoreTwo()
    {
        std::vector<tag_ProviderContact> vContacts = {{6}, {9, "張三"}};
        vContacts[0].bPhone = vContacts[0].bStarred = true;
        vContacts[1].strGroups = "7.9";
        vContacts[1].strAccounts = "2.40";
        vContacts[1].bSecret = vContacts[1].bMail = vContacts[1].bAddress = true;
        vContacts[1].llLastTime = 5'000'000'000'123;
        vContacts[1].iTimes = 3;
        vContacts[1].iStatusId = 70;
        vContacts[1].bOnline = true;
        Store(vContacts);
    }
};

TEST_F(CMemInitTest, WritesTheFilesByteForByte)
{
    StoreTwo();
    ASSERT_EQ(m_logic.MemInit(true), 0);
    Records vRecords(2 + STORE_SPARE_RECORDS, tag_ContactsStruct{});
    tag_ContactsStruct& named = vRecords[0];
    named.iContactID = 9;
    named.lGroupID[0] = 7;
    named.lGroupID[1] = 9;
    named.lGroupID[2] = SECRET_GROUP_ID;
    named.lAccountID[0] = 2;
    named.lAccountID[1] = 40;
    named.iFlags =
        CONTACT_FLAG_SECRET | CONTACT_FLAG_MAIL | CONTACT_FLAG_ADDRESS | CONTACT_FLAG_ONLINE;
    named.llLastTimeContacted = 5'000'000'000'123;
    named.iTimesContacted = 3;
    named.iStatusUpdateID = 70;
    std::wcscpy(named.szName, L"zhang 张san 三");
    Wide(LocalizerKeyOf("張三")).copy(named.szLocalizerKey, CONTACT_MAX_KEY);
    vRecords[1].iContactID = 6;
    vRecords[1].iFlags = CONTACT_FLAG_PHONE | CONTACT_FLAG_STARRED;
    vRecords[1].iSortIndex = 1;
    vRecords[1].szName[0] = NAME_EMPTY_MARK;
    EXPECT_TRUE(ReadFiles().strRecords == BytesOf(vRecords));
    EXPECT_EQ(Reg(), (tag_ContactReg{2, 0, 2 + STORE_SPARE_RECORDS}));
    EXPECT_TRUE(CDataDirectory::ReadBytes(CDataPaths::PinyinMapping()) ==
                CDataDirectory::ReadBytes(CDataPaths::PinyinSource()));
}

TEST_F(CMemInitTest, ReloadsWhenAFileIsMissingOrEmpty)
{
    EXPECT_EQ(m_logic.MemInit(false), 0) << "no contacts";
    EXPECT_EQ(Reg(), (tag_ContactReg{0, 0, STORE_SPARE_RECORDS}));
    EXPECT_EQ(Search("").Contacts(), Ids{});
    StoreTwo();
    const auto ExpectBuilt = [this]
    {
        EXPECT_EQ(IsNeedReload(), 1);
        EXPECT_EQ(m_logic.MemInit(false), 0);
        ExpectFresh();
    };
    for (const char* szPath : {CDataPaths::PinyinMapping(), CDataPaths::ContactReg()})
    {
        std::filesystem::resize_file(szPath, 0);
        ExpectBuilt();
        std::filesystem::remove(szPath);
        ExpectBuilt();
    }
    std::filesystem::remove(CDataPaths::ContactReg());
    EXPECT_TRUE(RunInChild([] { EXPECT_EQ(CLocalizerLogic().MemInit(false), 0); }));
    m_provider.Remove(9); // the other process's index is there: nothing is read
    EXPECT_EQ(m_logic.MemInit(false), 0);
    EXPECT_EQ(Search("").Contacts(), (Ids{9, 6}));
}

// Every line, as log.txt tells them: without the milliseconds, which differ from run to run, and
// without SQL texts.
TEST_F(CMemInitTest, TellsEachStepInOrder)
{
    StoreTwo();
    ASSERT_EQ(m_logic.MemInit(true), 0);
    m_log.Clear();
    m_logic.MemInit(true);
    const tag_Found all = Search("");
    Search("z", IME_SEARCH_WORD, nullptr, Chain(FILTER_GROUP, 99).get());
    Search("z", IME_SEARCH_WORD, all.set);
    long long allIds[] = {9};
    m_logic.OnContactsTableChanged(1, allIds);
    m_logic.OnContactsTableChanged(1, nullptr);
    m_logic.OnContactsTableChanged(0, allIds);
    m_logic.OnStatusUpdatesTableChanged(0, nullptr);
    m_logic.OnContactTimeChanged(999, 1);
    m_logic.OnContactStarChanged(999, 1);
    m_logic.OnContactsTableChanged();
    m_provider.Execute("drop table status_updates");
    EXPECT_EQ(CLocalizerLogic().MemInit(true), 0) << "without the online state";
    std::ostringstream told;
    for (const tag_LogLine& line : m_log.Lines())
    {
        if (line.strText.find("sqlstat_") == std::string::npos)
        {
            told << line << "$\n"; // some lines end with a line end of their own
        }
    }
    const std::regex milliseconds("(time =|EXIT takes) [0-9]+");
    EXPECT_EQ(std::regex_replace(told.str(), milliseconds, "$1 ms"),
              CDataDirectory::ReadBytes(QV_TEST_DATA "/Core/log.txt"));
}

} // namespace
