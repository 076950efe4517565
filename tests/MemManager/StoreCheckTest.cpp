#include "MemManager/StoreCheck.h"

#include "Filter/FilterChain.h"
#include "tests/MemManager/StoreFixture.h"

#include <random>

namespace
{

class StoreCheck : public StoreFixture
{
protected:
    // What every operation makes of a record that it must not trust.
    void ExpectRefused()
    {
        const std::string strReg = RegFile();
        const std::string strRecords = RecordsFile();
        int iTotal = 77;
        EXPECT_EQ(m_store.GetMemSize(&iTotal), 0);
        EXPECT_EQ(iTotal, 77);
        EXPECT_EQ(m_store.GetSortType(), 0);
        m_store.SetSortType(3);
        tag_ContactsStruct* pContacts = nullptr;
        tag_ContactReg* pReg = nullptr;
        EXPECT_EQ(m_store.OpenWriteShareMem(&pContacts, &pReg), -1);
        EXPECT_EQ(pReg, nullptr);
        ExpectNothingCopied();
        EXPECT_EQ(RegFile(), strReg);
        EXPECT_EQ(RecordsFile(), strRecords);
    }

    void ExpectNothingCopied()
    {
        tag_ContactsInfo* pInfo = nullptr;
        m_store.GetContactsResult(&pInfo);
        ASSERT_NE(pInfo, nullptr);
        EXPECT_EQ(pInfo->RecordNum, 0);
        delete pInfo;
        CFilterChain chain;
        tag_LocalizerResult* pResult = nullptr;
        m_store.CopyContactsResult(chain, &pResult);
        ASSERT_NE(pResult, nullptr);
        EXPECT_EQ(pResult->iResultNum, 0);
        EXPECT_EQ(pResult->pDetail, nullptr);
        m_store.FreeSearchResult(pResult);
    }
};

TEST_F(StoreCheck, TellsDamagedRecords)
{
    const struct
    {
        int64_t llFileSize;
        tag_ContactReg reg;
        bool bDamaged;
    } cases[] = {
        {0, {0, 0, 0}, false},
        {0, {0, 0, 1000}, false},
        {0, {0, 0, 1001}, true},
        {0, {1, 0, 0}, true},
        {703, {1, 0, 0}, true},
        {704, {1, 0, 0}, false},
        {704, {1, 1, 1000}, false},
        {704, {1, 1, 1001}, true},
        {1005 * 704, {5, 0, 1005}, false},
        {1005 * 704 - 1, {5, 0, 1005}, true},
        {1005 * 704, {1005, 0, 0}, false},
        {1005 * 704, {1005, -9, 3}, false},
        {1005 * 704, {-1, 0, 0}, true},
        {1005 * 704, {0, 0, -1}, true},
        {INT64_MAX, {INT32_MIN, 0, 0}, true},
        {INT64_MAX, {3050402, 0, 3050402}, false},
        {INT64_MAX, {3050403, 0, 0}, true},
        {INT64_MAX, {0, 0, 3050403}, true},
        {INT64_MAX, {6100806, 0, 0}, true},
        {INT64_MAX, {INT32_MAX, 0, INT32_MAX}, true},
    };
    for (const auto& entry : cases)
    {
        EXPECT_EQ(CStoreCheck::IsDamaged(entry.reg, entry.llFileSize), entry.bDamaged)
            << entry.reg << " beside " << entry.llFileSize;
    }
}

TEST_F(StoreCheck, RefusesDamagedRecordsEverywhere)
{
    const tag_ContactReg pDamaged[] = {
        {-1, 1, 1003}, {3, 1, -1},        {1004, 1, 1003},      {3, 1, 1004},
        {3, 1, 30000}, {6100806, 1, 100}, {3, 1, 16777216 * 3}, {INT32_MIN, 1, INT32_MIN},
    };
    for (const tag_ContactReg& reg : pDamaged)
    {
        ASSERT_EQ(Build(MakeRecords(3)), 0);
        SetReg(reg);
        EXPECT_TRUE(CStoreCheck::IsStoreDamaged()) << reg;
        ExpectRefused();
        const Lines vErrors = m_log.Texts(ERROR_LINE);
        ASSERT_FALSE(vErrors.empty());
        EXPECT_EQ(vErrors.back(), "QV_Contacts: damaged registration record: iTotalNum = " +
                                      std::to_string(reg.iTotalNum) +
                                      ", iMemSize = " + std::to_string(reg.iMemSize) +
                                      ", records file = 706112 bytes\n");
    }
    EXPECT_EQ(Build(MakeRecords(3)), 0) << "a build puts it right";
    EXPECT_EQ(Reg(), (tag_ContactReg{3, 0, 1003}));
}

TEST_F(StoreCheck, RefusesRecordsFilesThatAreTooShort)
{
    ASSERT_EQ(Build(MakeRecords(3)), 0);
    for (const size_t uLength : {size_t{0}, size_t{704}, size_t{3 * 704 - 1}})
    {
        CDataDirectory::WriteBytes(CDataPaths::ContactRecords(), std::string(uLength, 'x'));
        ExpectRefused();
    }
    ASSERT_EQ(unlink(CDataPaths::ContactRecords()), 0);
    ExpectRefused();
}

TEST_F(StoreCheck, TellsMissingFromDamaged)
{
    tag_ContactReg reg = {7, 7, 7};
    EXPECT_EQ(CStoreCheck::MapReg(&reg), -1);
    EXPECT_EQ(reg, (tag_ContactReg{7, 7, 7}));
    EXPECT_EQ(CStoreCheck::ReadReg(&reg), STORE_MISSING);
    EXPECT_EQ(reg, (tag_ContactReg{0, 0, 0}));
    EXPECT_FALSE(CStoreCheck::IsStoreDamaged());

    // A file that ends early is read as what extending it would make of it.
    CDataDirectory::WriteBytes(CDataPaths::ContactReg(), std::string("\0\0\0\0\1", 5));
    EXPECT_EQ(CStoreCheck::ReadReg(&reg), STORE_MISSING);
    EXPECT_EQ(reg, (tag_ContactReg{0, 1, 0}));
    CDataDirectory::WriteBytes(CDataPaths::ContactReg(), "\5");
    EXPECT_EQ(CStoreCheck::ReadReg(&reg), STORE_DAMAGED);
    ExpectRefused();

    SetReg({0, 1, 20});
    EXPECT_EQ(CStoreCheck::ReadReg(&reg), STORE_GOOD);
    EXPECT_EQ(CStoreCheck::MapReg(&reg), 0);
    EXPECT_EQ(reg, (tag_ContactReg{0, 1, 20}));
}

TEST_F(StoreCheck, RandomFilesHarmNobody)
{
    constexpr unsigned int SEED = 20240611;
    std::mt19937 random(SEED);
    CFilterChain chain;
    for (int iRound = 0; iRound < 200; ++iRound)
    {
        std::string strRecords(random() % 5000, '\0');
        for (char& c : strRecords)
        {
            c = static_cast<char>(random());
        }
        CDataDirectory::WriteBytes(CDataPaths::ContactRecords(), strRecords);
        SetReg({static_cast<int32_t>(random() % 9) - 1, 0, static_cast<int32_t>(random() % 1100)});
        tag_LocalizerResult* pResult = nullptr;
        m_store.CopyContactsResult(chain, &pResult);
        ASSERT_NE(pResult, nullptr);
        for (int i = 0; i < pResult->iResultNum; ++i)
        {
            EXPECT_EQ(pResult->pDetail[i].szLocalizerKey[10], L'\0');
            EXPECT_EQ(pResult->pDetail[i].szReserved[4], L'\0');
        }
        m_store.FreeSearchResult(pResult);
        tag_ContactsStruct* pContacts = nullptr;
        tag_ContactReg* pReg = nullptr;
        if (m_store.OpenWriteShareMem(&pContacts, &pReg) == 0 && pContacts != nullptr)
        {
            pContacts[pReg->iMemSize - 1].iContactID = 1;
        }
        m_store.CloseWriteShareMem();
    }
}

} // namespace
