// The store's files, its registration record and its lock, and the result sets made of it.

#include "Common/SystemTime.h"
#include "Filter/Filter.h"
#include "Filter/FilterChain.h"
#include "MemManager/ContactSelection.h"
#include "MemManager/Files/WriterLock.h"
#include "MemManager/MemManger.h"
#include "MemManager/StoreRegister.h"
#include "tests/Support/ChildProcess.h"
#include "tests/Support/LogCapture.h"
#include "tests/Support/MemoryFailure.h"
#include "tests/Support/StoreImage.h"

#include <algorithm>
#include <cstring>
#include <filesystem>
#include <gtest/gtest.h>
#include <memory>
#include <sys/stat.h>
#include <thread>

namespace
{

namespace fs = std::filesystem;

using Details = std::vector<tag_LocalizerDetail>;
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

// The entry that a search makes of a record.
tag_LocalizerDetail EntryOf(const tag_ContactsStruct& record)
{
    tag_LocalizerDetail entry = {};
    entry.iContactID = record.iContactID;
    entry.iSortIndex = record.iSortIndex;
    entry.llLastTimeContacted = record.llLastTimeContacted;
    std::copy_n(record.szLocalizerKey, CONTACT_MAX_KEY, entry.szLocalizerKey);
    std::copy_n(record.szReserved, 4, entry.szReserved);
    return entry;
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
            record.lGroupID[0] = i % 3;
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

    Set CopyContacts()
    {
        CFilterChain chain;
        tag_LocalizerResult* pSet = nullptr;
        m_store.CopyContactsResult(chain, &pSet);
        return Own(pSet);
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
    int iTotal = 0;
    EXPECT_EQ(m_store.GetMemSize(&iTotal), 1020);
    EXPECT_EQ(iTotal, 20);
    EXPECT_EQ(Build({}), 0);
    EXPECT_EQ(Reg(), (tag_ContactReg{0, 1, 1000}));
    EXPECT_EQ(ReadFiles().strRecords.size(), 1050U * 704);
    m_log.Clear();
    EXPECT_EQ(m_store.InitContactRecord(nullptr), -1);
    tag_ContactsStruct record = {};
    for (const int iNum : {-1, INT32_MIN, STORE_MAX_RECORDS - 999, INT32_MAX})
    {
        tag_ContactsInfo info = {iNum, &record};
        EXPECT_EQ(m_store.InitContactRecord(&info), -1) << iNum;
    }
    EXPECT_TRUE(m_log.Lines().empty());
}

TEST_F(Store, GivesUpAfterFiveRefusals)
{
    ASSERT_EQ(Build(MakeRecords(2)), 0);
    const CLockHolder holder;
    m_log.Clear();
    EXPECT_EQ(Build(MakeRecords(9)), -1);
    const Set set = CopyContacts();
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
    const Lines vDebug = m_log.Texts(DEBUG_LINE);
    EXPECT_EQ(std::count(vDebug.begin(), vDebug.end(), "QV_Contacts:Lock TRY LOCK"), 10)
        << "retries are silent";
    EXPECT_EQ(Reg(), (tag_ContactReg{2, 0, 1002}));
    ASSERT_NE(set, nullptr);
    EXPECT_EQ(set->pDetail, nullptr);
}

// The first refusal is what ends the other holder.
TEST_F(Store, CopiesAllRecordsOutAsSoonAsItHasTheLock)
{
    const Records vRecords = MakeRecords(5);
    ASSERT_EQ(Build(vRecords), 0);
    CLockHolder holder;
    const std::string strRefusal = "QV_Contacts: GetContactsResult Lock share mem false";
    m_log.AtEachLine(
        [&](const std::string& strText)
        {
            if (strText == strRefusal)
            {
                holder.Release();
            }
        });
    tag_ContactsInfo* pInfo = nullptr;
    m_store.GetContactsResult(&pInfo);
    const std::unique_ptr<tag_ContactsInfo> info(pInfo);
    const std::unique_ptr<tag_ContactsStruct[]> contacts(info->pContacts);
    ASSERT_EQ(info->RecordNum, 5);
    EXPECT_EQ(std::memcmp(contacts.get(), vRecords.data(), 5 * 704), 0);
    EXPECT_EQ(m_log.Texts(ERROR_LINE), Lines{strRefusal});
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
    for (const int iGranted : {0, 1})
    {
        const CMemoryFailure failure(iGranted);
        const Set set = CopyContacts();
        ASSERT_EQ(set == nullptr, iGranted == 0);
        EXPECT_TRUE(set == nullptr || (set->iResultNum == 0 && set->pDetail == nullptr));
    }
    {
        const CMemoryFailure failure(1);
        tag_ContactsInfo* pInfo = nullptr;
        m_store.GetContactsResult(&pInfo);
        const std::unique_ptr<tag_ContactsInfo> info(pInfo);
        EXPECT_EQ(info->RecordNum, 0);
    }
    {
        const CMemoryFailure failure(1);
        EXPECT_EQ(m_store.CopySearchResult(&source, &pSet), -1);
        EXPECT_EQ(pSet, nullptr);
    }
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
    const Records vRecords = MakeRecords(30);
    ASSERT_EQ(Build(vRecords), 0);
    const Set all = CopyContacts();
    ASSERT_EQ(all->iResultNum, 30);
    for (size_t i = 0; i < 30; ++i)
    {
        const tag_LocalizerDetail expected = EntryOf(vRecords[i]);
        EXPECT_EQ(EntryBytes(&all->pDetail[i], 1), EntryBytes(&expected, 1)) << i;
    }
    for (int iKind : {FILTER_GROUP, FILTER_PHONE, FILTER_FAVOURITES, FILTER_GROUP_EXPAND})
    {
        QVLong32 lId = 1;
        CFilterChain* pChain = nullptr;
        ASSERT_EQ(m_store.CreateFilterChain(&iKind, &lId, 1, &pChain), 0);
        const std::unique_ptr<CFilterChain> chain(pChain);
        Records vCopy = vRecords;
        Details vEntries(30);
        const int iKept =
            CCandidateEntries::Select(vCopy.data(), 30, false, *pChain, nullptr, vEntries.data())
                .iKept;
        tag_ContactsInfo copy = {30, vCopy.data()};
        const Set set = Own(new tag_LocalizerResult());
        CCandidateEntries::NarrowCopy(&copy, *pChain, set.get());
        EXPECT_TRUE(iKept >= 8 && iKept <= 20) << iKept;
        ASSERT_EQ(iKept, set->iResultNum) << iKind;
        EXPECT_EQ(EntryBytes(vEntries.data(), iKept), EntryBytes(set->pDetail, iKept)) << iKind;
    }
}

TEST_F(Store, MakesSetsAndPages)
{
    Details vEntries(10);
    vEntries[1].iContactID = 100;
    tag_LocalizerResult source = {10, vEntries.data()};
    tag_LocalizerResult* pSet = nullptr;
    EXPECT_EQ(m_store.NewSearchResult(&source, &pSet), 0);
    Set set = Own(pSet);
    EXPECT_EQ(EntryBytes(set->pDetail, set->iResultNum), std::string(10 * 88, '\0'));
    EXPECT_EQ(m_store.CopySearchResult(&source, &pSet), 0);
    set = Own(pSet);
    EXPECT_EQ(EntryBytes(set->pDetail, set->iResultNum), EntryBytes(vEntries.data(), 10));
    tag_LocalizerResult page = {};
    EXPECT_EQ(m_store.GetSearchRecord(&source, 9, 1, &page), 0);
    EXPECT_EQ(page.iResultNum, 1);
    EXPECT_EQ(page.pDetail, vEntries.data() + 9) << "a view";
    const int PAGES[][2] = {{10, 0}, {5, 6}, {-1, 1}, {0, -1}, {5, INT32_MAX}, {INT32_MAX, 1}};
    for (const auto& [iStart, iCount] : PAGES)
    {
        EXPECT_EQ(m_store.GetSearchRecord(&source, iStart, iCount, &page), -1) << iStart;
        EXPECT_EQ(page.pDetail, vEntries.data() + 9) << iStart;
    }
}

TEST_F(Store, CountsIndexCharacters)
{
    constexpr int WORDS[] = {'A', 'Z', '1', '5', '#', '0', '6', '@', '[', -1, INT32_MIN};
    Details vEntries(std::size(WORDS));
    for (size_t i = 0; i < vEntries.size(); ++i)
    {
        vEntries[i].iFirstWord = WORDS[i];
    }
    tag_LocalizerResult set = {11, vEntries.data()};
    std::vector<int> vCounts(28);
    EXPECT_EQ(m_store.GetFirstWordInfo(&set, vCounts.data()), 0);
    std::vector<int> vExpected(28);
    vExpected[0] = vExpected[25] = 1;
    vExpected[26] = 9;
    EXPECT_EQ(vCounts, vExpected);
    SetReg({0, STORE_ORDER_TIME, 0});
    vCounts.assign(7, 0);
    EXPECT_EQ(m_store.GetFirstWordInfo(&set, vCounts.data()), 0);
    EXPECT_EQ(vCounts, (std::vector<int>{1, 0, 0, 0, 1, 9, 0}));
}

TEST_F(Store, KnowsDamagedRegistrationRecords)
{
    const struct
    {
        int64_t llFileSize;
        tag_ContactReg reg;
        bool bDamaged;
    } ROWS[] = {
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
    for (const auto& row : ROWS)
    {
        EXPECT_EQ(CStoreRegister::IsDamaged(row.reg, row.llFileSize), row.bDamaged)
            << row.reg.iTotalNum << ", " << row.reg.iMemSize << ", " << row.llFileSize;
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
    SetReg({3, 1, 0});
    EXPECT_EQ(CStoreRegister::Lift(1003, STORE_ORDER_NAME), LIFT_OUT_OF_ORDER);
    EXPECT_EQ(CStoreRegister::Lift(0, STORE_ORDER_TIME), LIFT_FAILED);
    EXPECT_EQ(Reg(), (tag_ContactReg{3, 1, 0}));
    EXPECT_EQ(CStoreRegister::Lift(1003, STORE_ORDER_TIME), LIFT_DONE);
    EXPECT_EQ(Reg(), (tag_ContactReg{3, 1, 1003}));
}
