#include "Filter/FilterChain.h"
#include "Platform/LogSink.h"
#include "tests/MemManager/StoreFixture.h"
#include "tests/Support/MemoryFailure.h"

#include <filesystem>
#include <memory>
#include <sys/mman.h>

namespace
{

namespace fs = std::filesystem;

using ContactStore = StoreFixture;

TEST_F(ContactStore, RewritesTheStore)
{
    const Records vOld = MakeRecords(50);
    ASSERT_EQ(Build(vOld), 0);
    m_store.SetSortType(1);
    const Records vFew = MakeRecords(20, 1000);
    EXPECT_EQ(Build(vFew), 0);
    EXPECT_EQ(Reg(), (tag_ContactReg{20, 1, 1020}));
    EXPECT_EQ(RecordsFile(),
              BytesOf(vFew) + BytesOf(vOld).substr(20 * 704) + std::string(1000 * 704, '\0'))
        << "slots behind the new records keep what they held, the file its length";
    int iTotal = 0;
    EXPECT_EQ(m_store.GetMemSize(&iTotal), 1020);
    EXPECT_EQ(iTotal, 20);
    EXPECT_EQ(Build({}), 0);
    EXPECT_EQ(Reg(), (tag_ContactReg{0, 1, 1000}));
    EXPECT_EQ(RecordsFile().size(), 1050U * 704);
}

TEST_F(ContactStore, RefusesCountsThatNoStoreCanHold)
{
    EXPECT_EQ(m_store.InitContactRecord(nullptr), -1);
    tag_ContactsStruct record = {};
    for (const int iNum : {-1, INT32_MIN, STORE_MAX_RECORDS - 999, INT32_MAX})
    {
        tag_ContactsInfo info = {iNum, &record};
        EXPECT_EQ(m_store.InitContactRecord(&info), -1) << iNum;
    }
    EXPECT_TRUE(m_log.Lines().empty());
    m_store.SetSortType(1);
    EXPECT_TRUE(fs::is_empty(m_directory.File(""))) << "no store, no sort type";
}

TEST_F(ContactStore, GivesUpAfterFiveRefusals)
{
    ASSERT_EQ(Build(MakeRecords(2)), 0);
    const CLockHolder holder;
    m_log.Clear();
    EXPECT_EQ(Build(MakeRecords(9)), -1);
    CFilterChain chain;
    tag_LocalizerResult* pSet = nullptr;
    m_store.CopyContactsResult(chain, &pSet);
    Lines vExpected;
    for (const char* szStart : {"QV_Contacts:InitContactRecord", "QV_Contacts: CopyContactsResult"})
    {
        for (const char* szEnd : {"0", "1", "2", "3", "4", "return"})
        {
            vExpected.push_back(std::string(szStart) + " write share memo lock false " + szEnd);
        }
    }
    vExpected.back().erase(12, 1); // the last line alone has no blank there
    EXPECT_EQ(m_log.Texts(ERROR_LINE), vExpected);
    EXPECT_EQ(m_log.Count(DEBUG_LINE, "QV_Contacts:Lock TRY LOCK"), 10) << "retries are silent";
    EXPECT_EQ(Reg(), (tag_ContactReg{2, 0, 1002}));
    ASSERT_NE(pSet, nullptr);
    EXPECT_EQ(pSet->pDetail, nullptr);
    m_store.FreeSearchResult(pSet);
}

// A build whose source ends inside the records dies while it writes them.
TEST_F(ContactStore, MarksABuildThatIsNotFinished)
{
    constexpr size_t READABLE = 8 * 4096;
    const Records vOld = MakeRecords(100);
    ASSERT_EQ(Build(vOld), 0);
    StatusOfChild(
        []
        {
            auto* pSource = static_cast<char*>(mmap(nullptr, 2 * READABLE, PROT_READ | PROT_WRITE,
                                                    MAP_PRIVATE | MAP_ANONYMOUS, -1, 0));
            std::memset(pSource, 1, READABLE);
            mprotect(pSource + READABLE, READABLE, PROT_NONE);
            tag_ContactsInfo info = {90, reinterpret_cast<tag_ContactsStruct*>(pSource)};
            CMemManger().InitContactRecord(&info);
        });
    EXPECT_EQ(Reg(), (tag_ContactReg{100, 0, 0}));
    EXPECT_EQ(Build(vOld), 0) << "the lock is free";
    EXPECT_EQ(RecordsFile().substr(0, 100 * 704), BytesOf(vOld));
}

TEST_F(ContactStore, CopiesAllRecordsOutAsSoonAsItHasTheLock)
{
    const Records vRecords = MakeRecords(5);
    ASSERT_EQ(Build(vRecords), 0);
    CLockHolder holder;
    // The first refusal is what ends the other holder.
    const auto pfnSink =
        [](void* pContext, int iPriority, const char* /*szTag*/, const char* szText)
    {
        if (iPriority == ERROR_LINE)
        {
            EXPECT_STREQ(szText, "QV_Contacts: GetContactsResult Lock share mem false");
            static_cast<CLockHolder*>(pContext)->Kill();
        }
    };
    CLogSink::Set(pfnSink, &holder);
    tag_ContactsInfo* pInfo = nullptr;
    m_store.GetContactsResult(&pInfo);
    CLogSink::Set(nullptr, nullptr);
    ASSERT_NE(pInfo, nullptr);
    ASSERT_EQ(pInfo->RecordNum, 5);
    EXPECT_EQ(std::memcmp(pInfo->pContacts, vRecords.data(), 5 * 704), 0);
    delete[] pInfo->pContacts;
    delete pInfo;
}

TEST_F(ContactStore, CopiesNothingWithoutMemory)
{
    ASSERT_EQ(Build(MakeRecords(5)), 0);
    const CMemoryFailure failure(1);
    tag_ContactsInfo* pInfo = nullptr;
    m_store.GetContactsResult(&pInfo);
    const std::unique_ptr<tag_ContactsInfo> info(pInfo);
    EXPECT_EQ(info->RecordNum, 0);
    EXPECT_EQ(m_log.Texts(ERROR_LINE), Lines{"QV_Contacts: GetContactsResult NEW mem error"});
    EXPECT_EQ(m_store.LockMemo(), 1);
}

TEST_F(ContactStore, HoldsTheLockUntilItIsReleased)
{
    EXPECT_EQ(m_store.UnlockMemo(), 0);
    {
        CMemManger other;
        EXPECT_EQ(other.LockMemo(), 1);
        EXPECT_EQ(m_store.LockMemo(), 0);
        EXPECT_EQ(m_store.UnlockMemo(), 0);
        EXPECT_EQ(other.LockMemo(), 0) << "held already";
        EXPECT_EQ(m_store.LockMemo(), 0) << "and still held";
    }
    EXPECT_EQ(m_store.LockMemo(), 1) << "the destructor releases";
    EXPECT_EQ(m_store.UnlockMemo(), 1);
}

} // namespace
