#include "MemManager/StoreCheck.h"

#include "tests/MemManager/StoreFixture.h"

namespace
{

using StoreCheck = StoreFixture;

TEST_F(StoreCheck, TellsDamagedRecords)
{
    const struct
    {
        int64_t llFileSize;
        tag_ContactReg reg;
        bool bDamaged;
    } cases[] = {
        {0, {0, 0, 1000}, false},
        {0, {0, 0, 1001}, true},
        {0, {1, 0, 0}, true},
        {703, {1, 0, 0}, true},
        {704, {1, 0, 0}, false},
        {1005 * 704, {5, 0, 1005}, false},
        {1005 * 704 - 1, {5, 0, 1005}, true},
        {1005 * 704, {1005, -9, 3}, false},
        {1005 * 704, {0, 0, -1}, true},
        {INT64_MAX, {INT32_MIN, 0, 0}, true},
        {INT64_MAX, {3050402, 0, 3050402}, false},
        {INT64_MAX, {3050403, 0, 0}, true},
        {INT64_MAX, {0, 0, 3050403}, true},
    };
    for (const auto& entry : cases)
    {
        EXPECT_EQ(CStoreCheck::IsDamaged(entry.reg, entry.llFileSize), entry.bDamaged)
            << entry.reg.iTotalNum << ", " << entry.reg.iMemSize << ", " << entry.llFileSize;
    }
}

TEST_F(StoreCheck, RefusesADamagedRecordEverywhere)
{
    ASSERT_EQ(Build(MakeRecords(3)), 0);
    SetReg({1004, 1, 1003});
    EXPECT_EQ(m_store.GetMemSize(nullptr), 0);
    m_store.SetSortType(3);
    tag_ContactsStruct* pContacts = nullptr;
    tag_ContactReg* pReg = nullptr;
    EXPECT_EQ(m_store.OpenWriteShareMem(&pContacts, &pReg), -1);
    EXPECT_EQ(pReg, nullptr);
    tag_ContactsInfo* pInfo = nullptr;
    m_store.GetContactsResult(&pInfo);
    EXPECT_EQ(pInfo->RecordNum, 0);
    delete pInfo;
    EXPECT_EQ(Reg(), (tag_ContactReg{1004, 1, 1003}));
    EXPECT_EQ(m_log.Texts(ERROR_LINE).back(),
              "QV_Contacts: damaged registration record: iTotalNum = 1004, iMemSize = 1003, "
              "records file = 706112 bytes\n");
}

TEST_F(StoreCheck, TellsMissingFromDamaged)
{
    tag_ContactReg reg = {7, 7, 7};
    EXPECT_EQ(CStoreCheck::MapReg(&reg), -1);
    EXPECT_EQ(CStoreCheck::ReadReg(&reg), STORE_MISSING);
    EXPECT_FALSE(CStoreCheck::IsStoreDamaged());

    // A file that ends early is read as what extending it would make of it.
    CDataDirectory::WriteBytes(CDataPaths::ContactReg(), std::string("\0\0\0\0\1", 5));
    EXPECT_EQ(CStoreCheck::ReadReg(&reg), STORE_MISSING);
    EXPECT_EQ(reg, (tag_ContactReg{0, 1, 0}));
    CDataDirectory::WriteBytes(CDataPaths::ContactReg(), "\5");
    EXPECT_EQ(CStoreCheck::ReadReg(&reg), STORE_DAMAGED);
    EXPECT_TRUE(CStoreCheck::IsStoreDamaged());
}

} // namespace
