// The store's files, its registration record and its lock, and the result sets made of it.

#include "Common/SystemTime.h"
#include "Filter/Filter.h"
#include "Filter/FilterChain.h"
#include "MemManager/ContactSelection.h"
#include "MemManager/Files/StoreLock.h"
#include "MemManager/MemManger.h"
#include "MemManager/StoreRegister.h"
#include "tests/Support/ChildProcess.h"
#include "tests/Support/LogCapture.h"
#include "tests/Support/MemoryFailure.h"
#include "tests/Support/StoreImage.h"

#include <fcntl.h>
#include <filesystem>
#include <gtest/gtest.h>
#include <memory>
#include <sys/file.h>
#include <thread>

namespace
{

namespace fs = std::filesystem;

using Set = std::unique_ptr<tag_LocalizerResult, void (*)(tag_LocalizerResult*)>;

Set Own(tag_LocalizerResult* pSet)
{
    return {pSet, [](tag_LocalizerResult* pOwned) { CMemManger().FreeSearchResult(pOwned); }};
}

std::string EntryBytes(const tag_LocalizerDetail* pEntries, int iNum)
{
    return {reinterpret_cast<const char*>(pEntries),
            static_cast<size_t>(iNum) * sizeof(tag_LocalizerDetail)};
}

// A store manager in a data directory of its own.
class Store : public testing::Test
{
protected:
    // iNum records that differ in every field that is copied anywhere.
    static Records MakeRecords(int iNum, int iFirstID = 1)
    {
        Records vRecords(static_cast<size_t>(iNum));
        for (int i = 0; i < iNum; ++i)
        {
            tag_ContactsStruct& record = vRecords[static_cast<size_t>(i)];
            record.iContactID = iFirstID + i;
            record.iSortIndex = i;
            record.iFlags = static_cast<uint32_t>(i);
            record.lGroupID[0] = record.lAccountID[0] = i % 3;
            record.llLastTimeContacted = 5'000'000'000LL + i;
            record.szName[0] = static_cast<wchar_t>('a' + i % 26);
            std::fill_n(record.szLocalizerKey, i % (CONTACT_MAX_KEY + 2), 0x1000 + i);
            std::fill_n(record.szReserved, i % 7, 0x2000 + i);
        }
        return vRecords;
    }

    int Build(Records vRecords)
    {
        tag_ContactsInfo info = {static_cast<int32_t>(vRecords.size()), vRecords.data()};
        return m_store.InitContactRecord(&info);
    }

    Set CopyContacts(CFilterChain* pChain = nullptr)
    {
        CFilterChain everybody;
        tag_LocalizerResult* pSet = nullptr;
        m_store.CopyContactsResult(pChain == nullptr ? everybody : *pChain, &pSet);
        return Own(pSet);
    }

    Records GetContacts()
    {
        tag_ContactsInfo* pInfo = nullptr;
        m_store.GetContactsResult(&pInfo);
        const std::unique_ptr<tag_ContactsInfo> info(pInfo);
        const std::unique_ptr<tag_ContactsStruct[]> contacts(info->pContacts);
        return {info->pContacts, info->pContacts + info->RecordNum};
    }

    CDataDirectory m_directory;
    CLogCapture m_log;
    CMemManger m_store;
};

} // namespace

TEST_F(Store, IsRewritten)
{
    m_store.SetSortType(1);
    EXPECT_TRUE(fs::is_empty(m_directory.File(""))) << "no store, no sort type";
    const Records vOld = MakeRecords(50);
    ASSERT_EQ(Build(vOld), 0);
    m_store.SetSortType(1);
    const Records vFew = MakeRecords(20, 1000);
    EXPECT_EQ(Build(vFew), 0);
    EXPECT_EQ(Reg(), (tag_ContactReg{20, 1, 1020}));
    EXPECT_EQ(ReadFiles().strRecords,
              BytesOf(vFew) + BytesOf(vOld).substr(20 * 704) + std::string(1000 * 704, '\0'))
        << "slots behind the new records keep what they held, the file its length";
    EXPECT_EQ(Build({}), 0);
    EXPECT_EQ(Reg(), (tag_ContactReg{0, 1, 1000}));
    EXPECT_EQ(m_store.InitContactRecord(nullptr), -1);
    tag_ContactsStruct record = {};
    for (const int iNum : {-1, INT32_MIN, STORE_MAX_RECORDS - 999, INT32_MAX})
    {
        tag_ContactsInfo info = {iNum, &record};
        EXPECT_EQ(m_store.InitContactRecord(&info), -1) << iNum;
    }
    EXPECT_TRUE(m_log.Texts(ERROR_LINE).empty());
}

TEST_F(Store, GivesUpAfterFiveRefusals)
{
    ASSERT_EQ(Build(MakeRecords(2)), 0);
    CLockHolder holder;
    m_log.Clear();
    EXPECT_EQ(Build(MakeRecords(9)), -1);
    const Set set = CopyContacts();
    EXPECT_EQ(m_log.Take(), CDataDirectory::ReadBytes(QV_TEST_DATA "/MemManager/log.txt"))
        << "retries are silent";
    EXPECT_EQ(Reg(), (tag_ContactReg{2, 0, 1002}));
    ASSERT_NE(set, nullptr);
    EXPECT_EQ(set->pDetail, nullptr);
    // A copy of all waits until the lock is free.
    m_log.AtLinesWith("QV_Contacts: GetContactsResult Lock share mem false",
                      [&] { holder.Release(); });
    EXPECT_EQ(BytesOf(GetContacts()), BytesOf(MakeRecords(2)));
}

TEST_F(Store, WaitsForAWriterThatWaitsForTheDisk)
{
    CWriterLock other;
    ASSERT_TRUE(other.Take());
    std::thread flusher(
        [&other]
        {
            Sleep(20);
            other.Release();
        });
    EXPECT_EQ(Build(MakeRecords(2)), 0);
    flusher.join();
    EXPECT_EQ(Reg(), (tag_ContactReg{2, 0, 1002}));
}

// A child that was forked meanwhile has the lock's descriptor, too.
TEST_F(Store, ReleasesTheWriterLockOfForkedChildren)
{
    CWriterLock lock;
    ASSERT_TRUE(lock.Take());
    const CChild child([] { pause(); }, 60);
    lock.Release();
    const CDescriptor directory(open(m_directory.File("").c_str(), O_RDONLY));
    EXPECT_EQ(flock(directory.Get(), LOCK_EX | LOCK_NB), 0);
}

TEST_F(Store, HoldsTheLockUntilItIsReleased)
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

TEST_F(Store, CopiesNothingWithoutMemory)
{
    ASSERT_EQ(Build(MakeRecords(9)), 0);
    tag_LocalizerDetail entry = {};
    tag_LocalizerResult source = {1, &entry};
    tag_LocalizerResult* pSet = &source;
    EXPECT_EQ(WithMemoryFor(0, [&] { return CopyContacts(); }), nullptr);
    EXPECT_EQ(WithMemoryFor(1, [&] { return CopyContacts(); })->iResultNum, 0);
    EXPECT_EQ(BytesOf(WithMemoryFor(1, [&] { return GetContacts(); })), "");
    EXPECT_EQ(WithMemoryFor(1, [&] { return m_store.CopySearchResult(&source, &pSet); }), -1);
    EXPECT_EQ(pSet, nullptr);
    EXPECT_EQ(m_log.Texts(ERROR_LINE),
              (Lines{"QV_Contacts:CopyContactsResult new LocalizerResult error",
                     "QV_Contacts: CopyContactsResult NEW mem error",
                     "QV_Contacts: GetContactsResult NEW mem error",
                     "QV_Contacts: CopySearchResult malloc mem error"}));
    EXPECT_EQ(m_store.LockMemo(), 1);
}

// Of all contacts; then of those that pass filters, record by record and by the pipeline.
TEST_F(Store, MakesEntriesOfItsRecords)
{
    Records vRecords = MakeRecords(30);
    ASSERT_EQ(Build(vRecords), 0);
    const Set all = CopyContacts();
    ASSERT_EQ(all->iResultNum, 30);
    for (size_t i = 0; i < 30; ++i)
    {
        tag_LocalizerDetail expected = {};
        expected.iContactID = vRecords[i].iContactID;
        expected.iSortIndex = vRecords[i].iSortIndex;
        expected.llLastTimeContacted = vRecords[i].llLastTimeContacted;
        std::copy_n(vRecords[i].szLocalizerKey, CONTACT_MAX_KEY, expected.szLocalizerKey);
        std::copy_n(vRecords[i].szReserved, 4, expected.szReserved);
        EXPECT_EQ(EntryBytes(&all->pDetail[i], 1), EntryBytes(&expected, 1)) << i;
    }
    for (int iKind : {FILTER_GROUP, FILTER_PHONE, FILTER_ACCOUNT_EXPAND, FILTER_GROUP_EXPAND})
    {
        QVLong32 lId = 1;
        CFilterChain* pChain = nullptr;
        ASSERT_EQ(m_store.CreateFilterChain(&iKind, &lId, 1, &pChain), 0);
        const std::unique_ptr<CFilterChain> chain(pChain);
        const Set selected = CopyContacts(pChain);
        const Set narrowed = Own(new tag_LocalizerResult());
        Records vCopy = vRecords;
        tag_ContactsInfo copy = {30, vCopy.data()};
        CCandidateEntries::NarrowCopy(&copy, *chain, narrowed.get());
        EXPECT_TRUE(selected->iResultNum >= 8 && selected->iResultNum <= 20) << iKind;
        EXPECT_EQ(EntryBytes(selected->pDetail, selected->iResultNum),
                  EntryBytes(narrowed->pDetail, narrowed->iResultNum))
            << iKind;
    }
}

TEST_F(Store, MakesSetsAndPages)
{
    tag_LocalizerDetail aEntries[10] = {};
    aEntries[1].iContactID = 100;
    tag_LocalizerResult source = {10, aEntries};
    tag_LocalizerResult* pSet = nullptr;
    EXPECT_EQ(m_store.NewSearchResult(&source, &pSet), 0);
    Set set = Own(pSet);
    EXPECT_EQ(EntryBytes(set->pDetail, set->iResultNum), std::string(10 * 88, '\0'));
    EXPECT_EQ(m_store.CopySearchResult(&source, &pSet), 0);
    set = Own(pSet);
    EXPECT_EQ(EntryBytes(set->pDetail, set->iResultNum), EntryBytes(aEntries, 10));
    tag_LocalizerResult page = {};
    EXPECT_EQ(m_store.GetSearchRecord(&source, 0, 10, &page), 0);
    EXPECT_EQ(m_store.GetSearchRecord(&source, 9, 1, &page), 0);
    EXPECT_EQ(page.iResultNum, 1);
    int aiCounts[27] = {};
    EXPECT_EQ(
        (std::vector<int>{
            m_store.NewSearchResult(nullptr, &pSet), m_store.CopySearchResult(nullptr, &pSet),
            m_store.GetSearchRecord(nullptr, 0, 1, &page),
            m_store.GetIndexByContactsId(nullptr, 100), m_store.GetFirstWordInfo(nullptr, aiCounts),
            m_store.GetFirstWordInfo(&source, nullptr), m_store.FreeSearchResult(nullptr)}),
        std::vector<int>(7, -1));
    const int PAGES[][2] = {{10, 0}, {5, 6}, {-1, 1}, {0, -1}, {5, INT32_MAX}, {INT32_MAX, 1}};
    for (const auto& [iStart, iCount] : PAGES)
    {
        EXPECT_EQ(m_store.GetSearchRecord(&source, iStart, iCount, &page), -1) << iStart;
        EXPECT_EQ(page.pDetail, aEntries + 9) << "a view, untouched";
    }
    EXPECT_TRUE(m_log.Lines().empty());
}

TEST_F(Store, KnowsDamagedRegistrationRecords)
{
    const std::tuple<int64_t, tag_ContactReg, bool> ROWS[] = {
        // bytes of the records file, registration record, damaged
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
    for (const auto& [llFileSize, reg, bDamaged] : ROWS)
    {
        EXPECT_EQ(CStoreRegister::IsDamaged(reg, llFileSize), bDamaged)
            << reg.iTotalNum << ", " << reg.iMemSize << ", " << llFileSize;
    }
}

// Each state, and what the operations without a lock of their own make of it.
TEST_F(Store, TellsItsStates)
{
    tag_ContactReg reg = {7, 7, 7};
    EXPECT_EQ(CStoreRegister::Inspect(&reg), STORE_MISSING);
    CDataDirectory::WriteBytes(CDataPaths::ContactReg(), "");
    EXPECT_EQ(CStoreRegister::Inspect(&reg), STORE_MISSING);
    EXPECT_TRUE(m_log.Texts(ERROR_LINE).empty());
    EXPECT_EQ(m_store.GetMemSize(nullptr), 0);
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
    fs::remove(CDataPaths::ContactReg());
    fs::create_directory(CDataPaths::ContactReg());
    EXPECT_EQ(CStoreRegister::Inspect(&reg), STORE_UNREADABLE);
    EXPECT_EQ(Build(MakeRecords(3)), -1) << "its sort type would be lost";
    // A sort type that is set while records are written in another order leaves the mark.
    fs::remove(CDataPaths::ContactReg());
    EXPECT_EQ(CStoreRegister::Lift(1003, STORE_ORDER_NAME), LIFT_FAILED);
    EXPECT_FALSE(fs::exists(CDataPaths::ContactReg()));
    SetReg({3, 1, 0});
    EXPECT_EQ(CStoreRegister::Lift(1003, STORE_ORDER_NAME), LIFT_OUT_OF_ORDER);
    EXPECT_EQ(CStoreRegister::Lift(0, STORE_ORDER_TIME), LIFT_FAILED);
    EXPECT_EQ(Reg(), (tag_ContactReg{3, 1, 0}));
    EXPECT_EQ(CStoreRegister::Lift(1003, STORE_ORDER_TIME), LIFT_DONE);
    EXPECT_EQ(Reg(), (tag_ContactReg{3, 1, 1003}));
}
