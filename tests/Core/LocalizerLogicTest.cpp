// Building the index: what it says and what it writes; and the operations that the facade only
// hands on.

#include "tests/Core/FacadeFixture.h"
#include "tests/Support/ChildProcess.h"

#include <filesystem>

namespace
{

class CMemInitTest : public CFacadeTest
{
protected:
    // Two contacts whose order differs by id and by name.
    void StoreTwo()
    {
        std::vector<tag_ProviderContact> vContacts(2);
        vContacts[0].iId = 6;
        vContacts[0].bPhone = vContacts[0].bStarred = true;
        vContacts[1].iId = 9;
        vContacts[1].strName = "張三";
        vContacts[1].strGroups = "7.9";
        vContacts[1].strAccounts = "2.40";
        vContacts[1].bSecret = vContacts[1].bMail = vContacts[1].bAddress = true;
        vContacts[1].llLastTime = 5'000'000'000'123;
        vContacts[1].iTimes = 3;
        vContacts[1].iStatusId = 70;
        vContacts[1].bOnline = true;
        Store(vContacts);
        m_log.Clear();
    }

    // Their records in name order.
    static Records TwoByName()
    {
        Records vRecords(2, tag_ContactsStruct{});
        vRecords[0].iContactID = 9;
        vRecords[0].lGroupID[0] = 7;
        vRecords[0].lGroupID[1] = 9;
        vRecords[0].lGroupID[2] = SECRET_GROUP_ID;
        vRecords[0].lAccountID[0] = 2;
        vRecords[0].lAccountID[1] = 40;
        vRecords[0].iFlags =
            CONTACT_FLAG_SECRET | CONTACT_FLAG_MAIL | CONTACT_FLAG_ADDRESS | CONTACT_FLAG_ONLINE;
        vRecords[0].llLastTimeContacted = 5'000'000'000'123;
        vRecords[0].iTimesContacted = 3;
        vRecords[0].iStatusUpdateID = 70;
        std::wcscpy(vRecords[0].szName, L"zhang 张san 三");
        const std::wstring strKey = Wide(LocalizerKeyOf("張三"));
        std::copy(strKey.begin(), strKey.end(), vRecords[0].szLocalizerKey);
        vRecords[1].iContactID = 6;
        vRecords[1].iFlags = CONTACT_FLAG_PHONE | CONTACT_FLAG_STARRED;
        vRecords[1].iSortIndex = 1;
        vRecords[1].szName[0] = NAME_EMPTY_MARK;
        return vRecords;
    }
};

TEST_F(CMemInitTest, TellsEachStepInOrderAndWritesTheFilesByteForByte)
{
    StoreTwo();
    ASSERT_EQ(m_logic.MemInit(true), 0);
    m_log.Clear();
    ASSERT_EQ(m_logic.MemInit(true), 0);
    EXPECT_EQ(Told(), "[3 QV_Localize] QV_Contacts: MemInit IFL_InitalMap time = ms\n"
                      "[3 QV_ContactsLocalize_SO] QV_Contacts>>QV_ContactsLocalize_SO>>"
                      "SQLiteOperator>> ReadAllLocalizer begin"
                      "[3 QV_ContactsLocalize_SO] CSQLiteOperator:Find one contact is sms "
                      "online:statusid:70\n"
                      "[3 QV_Localize] QV_Contacts: MemInit ReadAllLocalizer time = ms\n"
                      "[3 QV_Localize] QV_Contacts: MemInit IFL_PtrQuickSort time = ms\n"
                      "[3 QV_Localize] QV_Contacts:Lock TRY LOCK"
                      "[3 QV_Localize] QV_Contacts:LOCK RET = 1 "
                      "[3 QV_Localize] QV_Contacts:UnLock TRY UNLOCK"
                      "[3 QV_Localize] QV_Contacts:UNLOCK RET = 1 "
                      "[3 QV_Localize] QV_Contacts: MemInit InitContactRecord time = ms\n");
    std::string strRecords = BytesOf(TwoByName());
    strRecords.resize((2 + STORE_SPARE_RECORDS) * sizeof(tag_ContactsStruct));
    EXPECT_TRUE(RecordsFile() == strRecords);
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
    m_provider.Execute("drop table status_updates");
    EXPECT_EQ(CLocalizerLogic().MemInit(true), 0) << "without the online state";
    EXPECT_TRUE(m_log.Has(DEBUG_LINE, "QV_Contacts: ReadAllSmsOnlineStatus  error = -1\n"));
}

} // namespace
