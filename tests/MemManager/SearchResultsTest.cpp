#include "Filter/Filter.h"
#include "Filter/FilterChain.h"
#include "Filter/RecordTest.h"
#include "MemManager/CandidateEntries.h"
#include "MemManager/SpecialNumbers.h"
#include "tests/MemManager/StoreFixture.h"
#include "tests/Support/MemoryFailure.h"

#include <memory>
#include <random>

namespace
{

class SearchResults : public StoreFixture
{
protected:
    using Set = std::unique_ptr<tag_LocalizerResult, void (*)(tag_LocalizerResult*)>;

    static Set Own(tag_LocalizerResult* pSet)
    {
        return {pSet, [](tag_LocalizerResult* pOwned) { CMemManger().FreeSearchResult(pOwned); }};
    }
    Set CopyContacts(CFilterChain& chain)
    {
        tag_LocalizerResult* pSet = nullptr;
        m_store.CopyContactsResult(chain, &pSet);
        return Own(pSet);
    }
    std::unique_ptr<CFilterChain> Chain(std::vector<int> vKinds, std::vector<QVLong32> vIds)
    {
        vKinds.reserve(1); // the arrays of an empty chain are not null either
        vIds.reserve(1);
        CFilterChain* pChain = nullptr;
        EXPECT_EQ(m_store.CreateFilterChain(vKinds.data(), vIds.data(),
                                            static_cast<int>(vKinds.size()), &pChain),
                  0);
        return std::unique_ptr<CFilterChain>(pChain);
    }
    static bool IsEmpty(const Set& set)
    {
        return set != nullptr && set->iResultNum == 0 && set->pDetail == nullptr;
    }
};

std::string EntryBytes(const tag_LocalizerDetail* pEntries, int iNum)
{
    return {reinterpret_cast<const char*>(pEntries),
            static_cast<size_t>(iNum) * sizeof(tag_LocalizerDetail)};
}

TEST_F(SearchResults, CopiesEveryContactInTheStoresOrder)
{
    Records vRecords = MakeRecords(30);
    std::fill_n(vRecords[2].szLocalizerKey, 11, L'k');
    std::fill_n(vRecords[2].szReserved, 6, L'r');
    vRecords[3].szReserved[0] = 'a';
    vRecords[3].szReserved[2] = 'b'; // behind the terminator
    ASSERT_EQ(Build(vRecords), 0);
    m_log.Clear();
    CFilterChain chain;
    const Set set = CopyContacts(chain);
    ASSERT_NE(set, nullptr);
    ASSERT_EQ(set->iResultNum, 30);
    for (int i = 0; i < 30; ++i)
    {
        const tag_ContactsStruct& record = vRecords[static_cast<size_t>(i)];
        tag_LocalizerDetail expected = {};
        expected.iContactID = record.iContactID;
        expected.iSortIndex = record.iSortIndex;
        expected.llLastTimeContacted = record.llLastTimeContacted;
        std::memcpy(expected.szLocalizerKey, record.szLocalizerKey, 10 * sizeof(wchar_t));
        std::fill_n(expected.szReserved, i == 2 ? 4 : 0, L'r');
        expected.szReserved[0] = record.szReserved[0];
        EXPECT_EQ(EntryBytes(&set->pDetail[i], 1), EntryBytes(&expected, 1)) << i;
    }
    const Lines vExpected = {
        "QV_Contacts:Lock TRY LOCK",
        "QV_Contacts:LOCK RET = 1 ",
        "QV_Contacts:CopyContactsResult iContactCount = 30\n",
        "QV_Contacts:UnLock TRY UNLOCK",
        "QV_Contacts:UNLOCK RET = 1 ",
        "QV_Contacts: CopyContactsResult Filter Result Num = 30\n",
    };
    EXPECT_EQ(m_log.Texts(DEBUG_LINE), vExpected);
    EXPECT_EQ(m_log.Lines().size(), vExpected.size());
}

TEST_F(SearchResults, KeepsWhatPassesTheChain)
{
    Records vRecords = MakeRecords(9);
    vRecords[4].iFlags = CONTACT_FLAG_PHONE | CONTACT_FLAG_ONLINE;
    vRecords[7].iFlags = CONTACT_FLAG_PHONE;
    ASSERT_EQ(Build(vRecords), 0);
    const struct
    {
        std::vector<int> vKinds;
        std::vector<QVLong32> vIds;
        std::vector<int> vKept;
    } cases[] = {
        {{FILTER_PHONE}, {0}, {5, 8}},
        {{FILTER_ONLINE}, {0}, {5}},
        {{FILTER_PHONE, FILTER_CONTACT_ID_EXPAND}, {0, 5}, {8}},
        {{FILTER_GROUP}, {77}, {}},
        {{FILTER_ONLINE, FILTER_CONTACT_ID_EXPAND}, {0, 5}, {}},
    };
    for (const auto& entry : cases)
    {
        m_log.Clear();
        const auto pChain = Chain(entry.vKinds, entry.vIds);
        const Set set = CopyContacts(*pChain);
        std::vector<int> vKept;
        vKept.reserve(9);
        for (int i = 0; i < set->iResultNum; ++i)
        {
            vKept.push_back(set->pDetail[i].iContactID);
        }
        EXPECT_EQ(vKept, entry.vKept);
        EXPECT_EQ(set->pDetail == nullptr, vKept.empty());
        EXPECT_TRUE(m_log.Has(DEBUG_LINE, "QV_Contacts: CopyContactsResult Filter Result Num = " +
                                              std::to_string(vKept.size()) + "\n"));
    }
}

TEST_F(SearchResults, GivesAnEmptySetWithoutStore)
{
    CFilterChain chain;
    EXPECT_TRUE(IsEmpty(CopyContacts(chain)));
    EXPECT_EQ(m_log.Texts(ERROR_LINE).size(), 1U);
    m_log.Clear();
    SetReg({0, 0, 1000});
    EXPECT_TRUE(IsEmpty(CopyContacts(chain)));
    EXPECT_TRUE(m_log.Texts(ERROR_LINE).empty());
    EXPECT_EQ(m_log.Lines().size(), 4U) << "the lock's lines alone";
    m_store.CopyContactsResult(chain, nullptr);
    EXPECT_EQ(m_log.Lines().size(), 4U);
}

TEST_F(SearchResults, GivesUpAfterFiveRefusals)
{
    ASSERT_EQ(Build(MakeRecords(2)), 0);
    const CLockHolder holder;
    CFilterChain chain;
    m_log.Clear();
    EXPECT_TRUE(IsEmpty(CopyContacts(chain)));
    Lines vExpected;
    for (int i = 0; i < 5; ++i)
    {
        vExpected.push_back("QV_Contacts: CopyContactsResult write share memo lock false " +
                            std::to_string(i));
    }
    vExpected.emplace_back("QV_Contacts:CopyContactsResult write share memo lock false return");
    EXPECT_EQ(m_log.Texts(ERROR_LINE), vExpected);
}

TEST_F(SearchResults, SurvivesWithoutMemory)
{
    ASSERT_EQ(Build(MakeRecords(9)), 0);
    const auto pAll = Chain({}, {});
    const auto pCopied = Chain({FILTER_ACCOUNT_EXPAND}, {5});
    const Lines vNoSet = {"QV_Contacts:CopyContactsResult new LocalizerResult error"};
    const Lines vNoArray = {"QV_Contacts: CopyContactsResult NEW mem error"};
    for (CFilterChain* pChain : {pAll.get(), pCopied.get()})
    {
        for (int iGranted = 0; iGranted < 13; ++iGranted)
        {
            m_log.Clear();
            const CMemoryFailure failure(iGranted);
            const Set set = CopyContacts(*pChain);
            if (failure.Failures() == 0)
            {
                EXPECT_EQ(set->iResultNum, 9);
                break;
            }
            EXPECT_EQ(set == nullptr, iGranted == 0);
            EXPECT_TRUE(set == nullptr || IsEmpty(set) || set->iResultNum == 9) << iGranted;
            const Lines vExpected = iGranted == 0 ? vNoSet : iGranted == 1 ? vNoArray : Lines{};
            EXPECT_EQ(m_log.Texts(ERROR_LINE), vExpected) << iGranted;
            EXPECT_EQ(m_store.LockMemo(), 1) << iGranted;
            EXPECT_EQ(m_store.UnlockMemo(), 1);
        }
    }
}

// Random records as damaged files hold them, with few enough ids that filters hit.
void FillRandomly(std::mt19937& random, tag_ContactsStruct* pRecord)
{
    auto* pBytes = reinterpret_cast<unsigned char*>(pRecord);
    for (size_t i = 0; i < sizeof(*pRecord); ++i)
    {
        pBytes[i] = static_cast<unsigned char>(random());
    }
    pRecord->iContactID = static_cast<int32_t>(random() % 50);
    for (QVLong32& lID : pRecord->lGroupID)
    {
        lID = static_cast<QVLong32>(random() % 6) - 1;
    }
    for (QVLong32& lID : pRecord->lAccountID)
    {
        lID = static_cast<QVLong32>(random() % 4);
    }
    pRecord->szLocalizerKey[random() % 11] = 0;
    if (random() % 2 == 0)
    {
        pRecord->szReserved[random() % 6] = 0;
    }
}

TEST_F(SearchResults, BothWaysToTheEntriesAgree)
{
    constexpr unsigned int SEED = 715;
    std::mt19937 random(SEED);
    int iKeptSomething = 0;
    for (int iRound = 0; iRound < 300; ++iRound)
    {
        Records vRecords(random() % 60);
        for (tag_ContactsStruct& record : vRecords)
        {
            FillRandomly(random, &record);
        }
        std::vector<int> vKinds;
        std::vector<QVLong32> vIds;
        for (unsigned int i = random() % 4; i > 0; --i)
        {
            vKinds.push_back(static_cast<int>(random() % 11));
            vIds.push_back(static_cast<QVLong32>(random() % 6) - 1);
        }
        const auto pChain = Chain(vKinds, vIds);
        if (!CRecordTest::CanTest(*pChain))
        {
            continue;
        }
        const int iNum = static_cast<int>(vRecords.size());
        std::vector<tag_LocalizerDetail> vEntries(vRecords.size());
        const CCandidateEntries::Counts counts =
            CCandidateEntries::Select(vRecords.data(), iNum, *pChain, nullptr, vEntries.data());
        const int iKept = counts.iKept;
        tag_ContactsInfo copy = {iNum, vRecords.data()};
        const Set set = Own(new tag_LocalizerResult());
        CCandidateEntries::NarrowCopy(&copy, *pChain, set.get());
        ASSERT_EQ(iKept, set->iResultNum) << "round " << iRound << ", seed " << SEED;
        ASSERT_EQ(EntryBytes(vEntries.data(), iKept), EntryBytes(set->pDetail, iKept))
            << "round " << iRound << ", seed " << SEED;
        iKeptSomething += iKept > 0 ? 1 : 0;
    }
    EXPECT_GT(iKeptSomething, 100) << "the test has to test something";
}

TEST_F(SearchResults, CopiesTheSpecialNumbers)
{
    m_store.CopySpecialNumberRecord(nullptr);
    tag_LocalizerResult* pSet = nullptr;
    m_store.CopySpecialNumberRecord(&pSet);
    const Set set = Own(pSet);
    ASSERT_NE(set, nullptr);
    ASSERT_EQ(set->iResultNum, 7);
    EXPECT_NE(set->pDetail, g_specialNumberRecords);
    EXPECT_EQ(EntryBytes(set->pDetail, 7), EntryBytes(g_specialNumberRecords, 7));
    const size_t lengths[] = {2, 4, 6, 2, 4, 4, 8};
    for (int i = 0; i < 7; ++i)
    {
        EXPECT_EQ(set->pDetail[i].iContactID, i);
        EXPECT_EQ(set->pDetail[i].iSortIndex, i);
        EXPECT_EQ(std::wcslen(set->pDetail[i].szLocalizerKey), lengths[i]);
    }
    EXPECT_EQ(set->pDetail[6].szLocalizerKey[7], wchar_t{0x3D2B});
    EXPECT_TRUE(m_log.Lines().empty());
    {
        const CMemoryFailure failure(1);
        m_store.CopySpecialNumberRecord(&pSet);
    }
    EXPECT_TRUE(IsEmpty(Own(pSet)));
    const CMemoryFailure failure(0);
    m_store.CopySpecialNumberRecord(&pSet);
    EXPECT_EQ(pSet, nullptr);
}

TEST_F(SearchResults, MakesSetsOfTheSameSize)
{
    tag_LocalizerDetail pEntries[10] = {};
    for (int i = 0; i < 10; ++i)
    {
        pEntries[i].iContactID = 100 + i;
    }
    for (const int iNum : {10, 4, 0})
    {
        tag_LocalizerResult source = {iNum, pEntries};
        tag_LocalizerResult* pNew = nullptr;
        tag_LocalizerResult* pCopy = nullptr;
        EXPECT_EQ(m_store.NewSearchResult(&source, &pNew), 0);
        EXPECT_EQ(m_store.CopySearchResult(&source, &pCopy), 0);
        const Set setNew = Own(pNew);
        const Set setCopy = Own(pCopy);
        EXPECT_EQ(setNew->iResultNum, iNum);
        EXPECT_EQ(setCopy->iResultNum, iNum);
        EXPECT_EQ(setNew->pDetail == nullptr, iNum == 0);
        EXPECT_EQ(setCopy->pDetail == nullptr, iNum == 0);
        EXPECT_EQ(EntryBytes(setNew->pDetail, iNum),
                  std::string(static_cast<size_t>(iNum) * 88, '\0'));
        EXPECT_EQ(EntryBytes(setCopy->pDetail, iNum), EntryBytes(pEntries, iNum));
    }
    EXPECT_EQ(m_store.NewSearchResult(nullptr, nullptr), -1);
    EXPECT_EQ(m_store.CopySearchResult(nullptr, nullptr), -1);
}

TEST_F(SearchResults, MakesNoSetsWithoutMemory)
{
    tag_LocalizerDetail entry = {};
    tag_LocalizerResult source = {1, &entry};
    for (const int iGranted : {0, 1})
    {
        auto* pNew = &source;
        auto* pCopy = &source;
        {
            const CMemoryFailure failure(iGranted);
            EXPECT_EQ(m_store.NewSearchResult(&source, &pNew), -1);
        }
        EXPECT_TRUE(m_log.Lines().empty());
        {
            const CMemoryFailure failure(iGranted);
            EXPECT_EQ(m_store.CopySearchResult(&source, &pCopy), -1);
        }
        EXPECT_EQ(pNew, nullptr);
        EXPECT_EQ(pCopy, nullptr);
    }
    EXPECT_EQ(m_log.Texts(ERROR_LINE), Lines{"QV_Contacts: CopySearchResult malloc mem error"});
}

TEST_F(SearchResults, PagesAreViews)
{
    tag_LocalizerDetail pEntries[10] = {};
    tag_LocalizerResult set = {10, pEntries};
    const struct
    {
        int iStart;
        int iCount;
        int iResult;
    } cases[] = {
        {0, 10, 0},         {9, 1, 0},
        {3, 0, 0},          {10, 0, -1},
        {5, 6, -1},         {-1, 1, -1},
        {0, -1, -1},        {5, INT32_MAX, -1},
        {INT32_MAX, 1, -1}, {INT32_MIN, INT32_MIN, -1},
    };
    for (const auto& entry : cases)
    {
        tag_LocalizerResult page = {-5, nullptr};
        EXPECT_EQ(m_store.GetSearchRecord(&set, entry.iStart, entry.iCount, &page), entry.iResult);
        const bool bDone = entry.iResult == 0;
        EXPECT_EQ(page.iResultNum, bDone ? entry.iCount : -5) << entry.iStart;
        EXPECT_EQ(page.pDetail, bDone ? pEntries + entry.iStart : nullptr) << entry.iStart;
    }
    tag_LocalizerResult empty = {};
    tag_LocalizerResult page = {};
    EXPECT_EQ(m_store.GetSearchRecord(&empty, 0, 0, &page), -1);
    EXPECT_EQ(m_store.GetSearchRecord(nullptr, 0, 0, &page), -1);
    EXPECT_EQ(m_store.GetSearchRecord(&set, 0, 1, nullptr), -1);
}

TEST_F(SearchResults, FindsContacts)
{
    tag_LocalizerDetail pEntries[3] = {};
    pEntries[0].iContactID = 7;
    pEntries[1].iContactID = -9;
    pEntries[2].iContactID = -9;
    tag_LocalizerResult set = {3, pEntries};
    EXPECT_EQ(m_store.GetIndexByContactsId(&set, 7), 0);
    EXPECT_EQ(m_store.GetIndexByContactsId(&set, -9), 1);
    EXPECT_EQ(m_store.GetIndexByContactsId(&set, 8), 0);
    EXPECT_EQ(m_store.GetIndexByContactsId(nullptr, 7), -1);
}

TEST_F(SearchResults, CountsIndexCharacters)
{
    constexpr int32_t WORDS[] = {'A', 'Z', 'A', '1', '5', '#',      '0',
                                 '6', '@', '[', 0,   -1,  INT32_MIN};
    tag_LocalizerDetail pEntries[std::size(WORDS)] = {};
    for (size_t i = 0; i < std::size(WORDS); ++i)
    {
        pEntries[i].iFirstWord = WORDS[i];
    }
    tag_LocalizerResult set = {static_cast<int32_t>(std::size(WORDS)), pEntries};
    int piCounts[28] = {};
    EXPECT_EQ(m_store.GetFirstWordInfo(&set, piCounts), 0);
    EXPECT_EQ(m_store.GetFirstWordInfo(&set, piCounts), 0);
    int piExpected[28] = {};
    piExpected[0] = 4;
    piExpected[25] = 2;
    piExpected[26] = 20;
    EXPECT_TRUE(std::equal(piCounts, piCounts + 28, piExpected));

    SetReg({0, 1, 0});
    int piSections[7] = {};
    EXPECT_EQ(m_store.GetFirstWordInfo(&set, piSections), 0);
    const int piExpectedSections[7] = {1, 0, 0, 0, 1, 11, 0};
    EXPECT_TRUE(std::equal(piSections, piSections + 7, piExpectedSections));
    EXPECT_EQ(m_store.GetFirstWordInfo(nullptr, piSections), -1);
    EXPECT_EQ(m_store.GetFirstWordInfo(&set, nullptr), -1);
}

TEST_F(SearchResults, ReleasesSets)
{
    EXPECT_EQ(m_store.FreeSearchResult(nullptr), -1);
    EXPECT_EQ(m_store.FreeSearchResult(new tag_LocalizerResult()), 0);
    EXPECT_EQ(m_store.FreeSearchResult(new tag_LocalizerResult{2, new tag_LocalizerDetail[2]}), 0);
}

} // namespace
