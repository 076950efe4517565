#include "MemManager/MappingGuards.h"
#include "Platform/LogSink.h"
#include "tests/MemManager/StoreFixture.h"
#include "tests/Support/MemoryFailure.h"

#include <filesystem>
#include <memory>
#include <sys/mman.h>
#include <sys/resource.h>
#include <sys/wait.h>

namespace
{

namespace fs = std::filesystem;

class ContactStore : public StoreFixture
{
};

TEST_F(ContactStore, BuildsTheTwoFilesExactly)
{
    const Records vRecords = MakeRecords(3);
    EXPECT_EQ(Build(vRecords), 0);
    EXPECT_EQ(RecordsFile(), Bytes(vRecords) + std::string(1000 * 704, '\0'));
    EXPECT_EQ(Reg(), (tag_ContactReg{3, 0, 1003}));
    EXPECT_TRUE(m_log.Texts(ERROR_LINE).empty());
}

TEST_F(ContactStore, RewritesASmallerAndALargerStore)
{
    const Records vOld = MakeRecords(50);
    ASSERT_EQ(Build(vOld), 0);
    m_store.SetSortType(1);
    const Records vFew = MakeRecords(20, 1000);
    EXPECT_EQ(Build(vFew), 0);
    EXPECT_EQ(Reg(), (tag_ContactReg{20, 1, 1020}));
    EXPECT_EQ(RecordsFile(),
              Bytes(vFew) + Bytes(vOld).substr(20 * 704) + std::string(1000 * 704, '\0'))
        << "slots behind the new records keep what they held, the file its length";
    const Records vMany = MakeRecords(300);
    EXPECT_EQ(Build(vMany), 0);
    EXPECT_EQ(Reg(), (tag_ContactReg{300, 1, 1300}));
    EXPECT_EQ(RecordsFile(), Bytes(vMany) + std::string(1000 * 704, '\0'));
}

TEST_F(ContactStore, BuildsAnEmptyStore)
{
    tag_ContactsInfo none = {0, nullptr};
    EXPECT_EQ(m_store.InitContactRecord(&none), 0);
    EXPECT_FALSE(CDataDirectory::Exists(CDataPaths::ContactRecords()));
    EXPECT_EQ(Reg(), (tag_ContactReg{0, 0, 1000}));

    ASSERT_EQ(Build(MakeRecords(5)), 0);
    const std::string strRecords = RecordsFile();
    m_store.SetSortType(1);
    EXPECT_EQ(m_store.InitContactRecord(&none), 0);
    EXPECT_EQ(Reg(), (tag_ContactReg{0, 1, 1000}));
    EXPECT_EQ(RecordsFile(), strRecords);
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
    EXPECT_TRUE(fs::is_empty(m_directory.File("")));
}

TEST_F(ContactStore, GivesUpAfterFiveRefusals)
{
    ASSERT_EQ(Build(MakeRecords(2)), 0);
    const CLockHolder holder;
    m_log.Clear();
    EXPECT_EQ(Build(MakeRecords(9)), -1);
    Lines vExpected;
    for (int i = 0; i < 5; ++i)
    {
        vExpected.push_back("QV_Contacts:InitContactRecord write share memo lock false " +
                            std::to_string(i));
    }
    vExpected.emplace_back("QV_Contacts:InitContactRecord write share memo lock false return");
    EXPECT_EQ(m_log.Texts(ERROR_LINE), vExpected);
    EXPECT_EQ(Reg(), (tag_ContactReg{2, 0, 1002}));
}

TEST_F(ContactStore, ReleasesTheLockWhateverFails)
{
    fs::create_directory(CDataPaths::ContactReg());
    const Records vRecords = MakeRecords(3);
    EXPECT_EQ(Build(vRecords), -1);
    EXPECT_EQ(RecordsFile(), Bytes(vRecords) + std::string(1000 * 704, '\0'));
    fs::remove(CDataPaths::ContactReg());
    fs::remove(CDataPaths::ContactRecords());
    fs::create_directory(CDataPaths::ContactRecords());
    EXPECT_EQ(Build(vRecords), -1);
    EXPECT_FALSE(CDataDirectory::Exists(CDataPaths::ContactReg()));
    EXPECT_EQ(m_store.LockMemo(), 1);
}

TEST_F(ContactStore, KeepsTheOldIndexWhenTheFileCannotGrow)
{
    const Records vOld = MakeRecords(3);
    ASSERT_EQ(Build(vOld), 0);
    const std::string strRecords = RecordsFile();
    EXPECT_TRUE(RunInChild(
        [&]
        {
            const rlimit limit = {1003 * 704, 1003 * 704};
            ASSERT_EQ(setrlimit(RLIMIT_FSIZE, &limit), 0);
            EXPECT_EQ(Build(MakeRecords(4)), -1);
            EXPECT_EQ(Build(MakeRecords(3)), 0);
        }));
    EXPECT_EQ(RecordsFile(), strRecords);
    EXPECT_EQ(Reg(), (tag_ContactReg{3, 0, 1003}));
}

TEST_F(ContactStore, ReportsADirectoryThatCannotBeWritten)
{
    fs::permissions(m_directory.Root(), fs::perms(0755));
    fs::permissions(m_directory.File(""), fs::perms(0555));
    EXPECT_TRUE(RunInChild(
        [&]
        {
            DropRoot();
            EXPECT_EQ(Build(MakeRecords(3)), -1);
            EXPECT_TRUE(m_log.Has(
                ERROR_LINE, "QV_Contacts:InitContactRecord write share memo lock false return"));
            EXPECT_EQ(m_store.LockMemo(), 0);
            m_store.SetSortType(1);
            tag_ContactsStruct* pContacts = nullptr;
            tag_ContactReg* pReg = nullptr;
            EXPECT_EQ(m_store.OpenWriteShareMem(&pContacts, &pReg), -1);
            EXPECT_EQ(m_store.GetMemSize(nullptr), 0);
        }));
    EXPECT_TRUE(fs::is_empty(m_directory.File("")));
    fs::permissions(m_directory.File(""), fs::perms(0755));
}

// A build whose source ends inside the records dies half-way through writing them.
TEST_F(ContactStore, MarksABuildThatIsNotFinished)
{
    constexpr size_t PAGE = 4096;
    constexpr size_t READABLE = 8 * PAGE;
    Records vOld = MakeRecords(100);
    ASSERT_EQ(Build(vOld), 0);
    m_store.SetSortType(1);
    ASSERT_EQ(Build(vOld), 0);
    const int iStatus = StatusOfChild(
        []
        {
            auto* pSource = static_cast<char*>(mmap(nullptr, 2 * READABLE, PROT_READ | PROT_WRITE,
                                                    MAP_PRIVATE | MAP_ANONYMOUS, -1, 0));
            std::memset(pSource, 1, READABLE);
            mprotect(pSource + READABLE, READABLE, PROT_NONE);
            tag_ContactsInfo info = {90, reinterpret_cast<tag_ContactsStruct*>(pSource)};
            CMemManger().InitContactRecord(&info);
        });
    EXPECT_NE(iStatus, 0);
    EXPECT_NE(RecordsFile().substr(0, 704), Bytes(vOld).substr(0, 704)) << "some were written";
    EXPECT_EQ(Reg(), (tag_ContactReg{100, 1, 0}));
    EXPECT_EQ(Build(vOld), 0) << "the lock is free";
    EXPECT_EQ(Reg(), (tag_ContactReg{100, 1, 1100}));
    EXPECT_EQ(RecordsFile().substr(0, 100 * 704), Bytes(vOld));
}

TEST_F(ContactStore, CopiesAllRecordsOut)
{
    m_store.GetContactsResult(nullptr);
    const Records vRecords = MakeRecords(25);
    ASSERT_EQ(Build(vRecords), 0);
    m_log.Clear();
    tag_ContactsInfo* pInfo = nullptr;
    m_store.GetContactsResult(&pInfo);
    ASSERT_NE(pInfo, nullptr);
    ASSERT_EQ(pInfo->RecordNum, 25);
    EXPECT_EQ(std::memcmp(pInfo->pContacts, vRecords.data(), 25 * 704), 0);
    EXPECT_TRUE(m_log.Has(DEBUG_LINE, "QV_Contacts:GetContactsResult iContactCount = 25\n"));
    EXPECT_EQ(m_store.LockMemo(), 1);
    delete[] pInfo->pContacts;
    delete pInfo;
}

TEST_F(ContactStore, CopiesNothingWithoutStoreOrMemory)
{
    const auto CopyOut = [&]
    {
        tag_ContactsInfo* pInfo = nullptr;
        m_store.GetContactsResult(&pInfo);
        EXPECT_TRUE(pInfo == nullptr || (pInfo->RecordNum == 0 && pInfo->pContacts == nullptr));
        const bool bSet = pInfo != nullptr;
        delete pInfo;
        return bSet;
    };
    EXPECT_TRUE(CopyOut());
    SetReg({0, 0, 1000});
    EXPECT_TRUE(CopyOut());
    ASSERT_EQ(Build(MakeRecords(5)), 0);
    {
        const CMemoryFailure failure(0);
        EXPECT_FALSE(CopyOut());
    }
    m_log.Clear();
    {
        const CMemoryFailure failure(1);
        EXPECT_TRUE(CopyOut());
    }
    EXPECT_EQ(m_log.Texts(ERROR_LINE), Lines{"QV_Contacts: GetContactsResult NEW mem error"});
    EXPECT_EQ(m_store.LockMemo(), 1);
}

TEST_F(ContactStore, WaitsForTheLockToCopyOut)
{
    ASSERT_EQ(Build(MakeRecords(5)), 0);
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
    EXPECT_EQ(pInfo->RecordNum, 5);
    delete[] pInfo->pContacts;
    delete pInfo;
}

TEST_F(ContactStore, TellsCapacityAndSortType)
{
    int iTotal = 77;
    EXPECT_EQ(m_store.GetMemSize(&iTotal), 0);
    EXPECT_EQ(iTotal, 77);
    EXPECT_EQ(m_store.GetSortType(), 0);
    EXPECT_EQ(m_log.Texts(ERROR_LINE).size(), 2U);
    ASSERT_EQ(Build(MakeRecords(7)), 0);
    EXPECT_EQ(m_store.GetMemSize(nullptr), 1007);
    EXPECT_EQ(m_store.GetMemSize(&iTotal), 1007);
    EXPECT_EQ(iTotal, 7);
    for (const int iSortType : {1, 0, 5, -3})
    {
        m_store.SetSortType(iSortType);
        EXPECT_EQ(m_store.GetSortType(), iSortType);
        EXPECT_EQ(Reg(), (tag_ContactReg{7, iSortType, 0}));
    }
    EXPECT_EQ(m_store.GetMemSize(&iTotal), 0);
    EXPECT_EQ(iTotal, 7);
}

TEST_F(ContactStore, SetsNoSortTypeWithoutAStore)
{
    m_store.SetSortType(1);
    EXPECT_TRUE(fs::is_empty(m_directory.File("")));
    for (const size_t uLength : {0U, 1U, 8U, 11U})
    {
        CDataDirectory::WriteBytes(CDataPaths::ContactReg(), std::string(uLength, '\0'));
        m_store.SetSortType(1);
        EXPECT_EQ(RegFile(), std::string(uLength, '\0'));
        EXPECT_EQ(m_store.GetSortType(), 0);
    }
}

// A build orders the records by what GetSortType tells, so that is what it must write.
TEST_F(ContactStore, KeepsOnlyASortTypeThatCouldBeRead)
{
    const tag_ContactReg damaged = {-5, 1, 1000};
    SetReg(damaged);
    EXPECT_EQ(m_store.GetSortType(), 0);
    EXPECT_EQ(Build(MakeRecords(2)), 0);
    EXPECT_EQ(Reg(), (tag_ContactReg{2, 0, 1002}));
    CDataDirectory::WriteBytes(CDataPaths::ContactReg(), std::string("\0\0\0\0\1\0\0\0", 8));
    EXPECT_EQ(m_store.GetSortType(), 0);
    EXPECT_EQ(Build(MakeRecords(2)), 0);
    EXPECT_EQ(Reg(), (tag_ContactReg{2, 0, 1002}));
}

TEST_F(ContactStore, PatchesInPlace)
{
    ASSERT_EQ(Build(MakeRecords(4)), 0);
    tag_ContactsStruct* pContacts = nullptr;
    tag_ContactReg* pReg = nullptr;
    EXPECT_EQ(m_store.LockMemo(), 1);
    EXPECT_EQ(m_store.OpenWriteShareMem(nullptr, &pReg), -1);
    EXPECT_EQ(m_store.OpenWriteShareMem(&pContacts, nullptr), -1);
    ASSERT_EQ(m_store.OpenWriteShareMem(&pContacts, &pReg), 0);
    EXPECT_EQ(*pReg, (tag_ContactReg{4, 0, 1004}));
    pContacts[1003].iContactID = 99;
    pReg->iTotalNum = 1004;
    // Opening again closes first and finds what was written.
    ASSERT_EQ(m_store.OpenWriteShareMem(&pContacts, &pReg), 0);
    EXPECT_EQ(pContacts[1003].iContactID, 99);
    EXPECT_EQ(pReg->iTotalNum, 1004);
    m_store.CloseWriteShareMem();
    m_store.CloseWriteShareMem();
    EXPECT_EQ(m_store.UnlockMemo(), 1);
    EXPECT_EQ(RecordsFile().size(), 1004U * 704);
}

TEST_F(ContactStore, OpensAStoreWithoutCapacity)
{
    tag_ContactsStruct record = {};
    tag_ContactsStruct* pContacts = &record;
    tag_ContactReg* pReg = nullptr;
    ASSERT_EQ(m_store.OpenWriteShareMem(&pContacts, &pReg), 0) << "a missing record is created";
    EXPECT_EQ(pContacts, nullptr);
    EXPECT_EQ(*pReg, (tag_ContactReg{0, 0, 0}));
    m_store.CloseWriteShareMem();
    ASSERT_EQ(Build(MakeRecords(4)), 0);
    m_store.SetSortType(1);
    pContacts = &record;
    ASSERT_EQ(m_store.OpenWriteShareMem(&pContacts, &pReg), 0);
    EXPECT_EQ(pContacts, nullptr);
    EXPECT_EQ(*pReg, (tag_ContactReg{4, 1, 0}));
}

TEST_F(ContactStore, KeepsNoMappingOfHalfAStore)
{
    SetReg({0, 0, 1000});
    fs::create_directory(CDataPaths::ContactRecords());
    tag_ContactsStruct* pContacts = nullptr;
    tag_ContactReg* pReg = nullptr;
    EXPECT_EQ(m_store.OpenWriteShareMem(&pContacts, &pReg), -1);
    EXPECT_EQ(pReg, nullptr);
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
        CStoreLock third;
        EXPECT_FALSE(third.TryLock()) << "and still held";
    }
    EXPECT_EQ(m_store.LockMemo(), 1) << "the destructor releases";
    EXPECT_EQ(m_store.UnlockMemo(), 1);
    EXPECT_EQ(m_store.UnlockMemo(), 0);
}

TEST_F(ContactStore, UpdateContactRecordDoesNothing)
{
    EXPECT_EQ(m_store.UpdateContactRecord(nullptr), 0);
    EXPECT_TRUE(fs::is_empty(m_directory.File("")));
}

} // namespace
