#include "MemManager/StoreRegister.h"

#include "tests/MemManager/StoreFixture.h"

#include <sys/stat.h>

namespace
{

using StoreRegister = StoreFixture;

TEST_F(StoreRegister, TellsDamagedRecords)
{
    const struct
    {
        int64_t llFileSize;
        tag_ContactReg reg;
        bool bDamaged;
    } cases[] = {
        {0, {0, 0, 1000}, false},
        {0, {0, 0, 1001}, true},
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
        EXPECT_EQ(CStoreRegister::IsDamaged(entry.reg, entry.llFileSize), entry.bDamaged)
            << entry.reg.iTotalNum << ", " << entry.reg.iMemSize << ", " << entry.llFileSize;
    }
}

// Each state, and what the operations without a lock of their own make of it.
TEST_F(StoreRegister, TellsTheStates)
{
    tag_ContactReg reg = {7, 7, 7};
    EXPECT_EQ(CStoreRegister::Inspect(&reg), STORE_MISSING);
    EXPECT_TRUE(m_log.Texts(ERROR_LINE).empty());
    CDataDirectory::WriteBytes(CDataPaths::ContactReg(), "");
    EXPECT_EQ(CStoreRegister::Inspect(&reg), STORE_MISSING);
    CDataDirectory::WriteBytes(CDataPaths::ContactReg(), std::string("\0\0\0\0\1", 5));
    EXPECT_EQ(CStoreRegister::Inspect(&reg), STORE_DAMAGED);
    EXPECT_EQ(reg, (tag_ContactReg{0, 0, 0}));

    ASSERT_EQ(Build(MakeRecords(3)), 0);
    EXPECT_EQ(CStoreRegister::Read(&reg), STORE_WHOLE);
    EXPECT_EQ(reg, (tag_ContactReg{3, 0, 1003}));
    m_store.SetSortType(1);
    EXPECT_EQ(CStoreRegister::Read(&reg), STORE_MARKED);

    SetReg({1004, 1, 1003});
    m_store.SetSortType(3);
    tag_ContactsStruct* pContacts = nullptr;
    tag_ContactReg* pReg = nullptr;
    EXPECT_EQ(m_store.OpenWriteShareMem(&pContacts, &pReg), -1);
    EXPECT_EQ(Reg(), (tag_ContactReg{1004, 1, 1003}));
    EXPECT_EQ(m_log.Texts(ERROR_LINE).back(),
              "QV_Contacts: damaged registration record: iTotalNum = 1004, iMemSize = 1003, "
              "records file = 706112 bytes\n");

    unlink(CDataPaths::ContactReg());
    ASSERT_EQ(mkdir(CDataPaths::ContactReg(), 0700), 0);
    EXPECT_EQ(CStoreRegister::Inspect(&reg), STORE_UNREADABLE);
    EXPECT_EQ(Build(MakeRecords(3)), -1) << "its sort type would be lost";
}

// A sort type that is set while records are written in another order leaves the mark.
TEST_F(StoreRegister, LiftsOnlyTheOrderOfTheRecords)
{
    tag_ContactReg mapped = {3, 1, 0};
    CStoreRegister reg(mapped);
    EXPECT_FALSE(reg.Lift(4, 1003, 0));
    EXPECT_EQ(mapped, (tag_ContactReg{4, 1, 0}));
    EXPECT_TRUE(reg.Lift(5, 1003, 1));
    EXPECT_EQ(mapped, (tag_ContactReg{5, 1, 1003}));
}

} // namespace
