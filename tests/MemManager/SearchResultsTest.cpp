#include "Filter/Filter.h"
#include "Filter/FilterChain.h"
#include "MemManager/CandidateEntries.h"
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
    Set CopyContacts()
    {
        CFilterChain chain;
        tag_LocalizerResult* pSet = nullptr;
        m_store.CopyContactsResult(chain, &pSet);
        return Own(pSet);
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
    ASSERT_EQ(Build(vRecords), 0);
    const Set set = CopyContacts();
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
        EXPECT_EQ(EntryBytes(&set->pDetail[i], 1), EntryBytes(&expected, 1)) << i;
    }
}

TEST_F(SearchResults, FindsNothingWithoutMemory)
{
    ASSERT_EQ(Build(MakeRecords(9)), 0);
    for (const int iGranted : {0, 1})
    {
        const CMemoryFailure failure(iGranted);
        const Set set = CopyContacts();
        ASSERT_EQ(set == nullptr, iGranted == 0);
        EXPECT_TRUE(set == nullptr || (set->iResultNum == 0 && set->pDetail == nullptr));
    }
    EXPECT_EQ(m_log.Texts(ERROR_LINE),
              (Lines{"QV_Contacts:CopyContactsResult new LocalizerResult error",
                     "QV_Contacts: CopyContactsResult NEW mem error"}));
    EXPECT_EQ(m_store.LockMemo(), 1);
}

// Random records as damaged files hold them, in few enough groups that filters hit.
void FillRandomly(std::mt19937& random, tag_ContactsStruct* pRecord)
{
    auto* pBytes = reinterpret_cast<unsigned char*>(pRecord);
    std::generate_n(pBytes, sizeof(*pRecord),
                    [&random] { return static_cast<unsigned char>(random()); });
    for (QVLong32& lID : pRecord->lGroupID)
    {
        lID = static_cast<QVLong32>(random() % 6) - 1;
    }
    pRecord->szLocalizerKey[random() % 11] = 0;
}

TEST_F(SearchResults, BothWaysToTheEntriesAgree)
{
    constexpr int KINDS[] = {FILTER_GROUP, FILTER_PHONE, FILTER_FAVOURITES, FILTER_GROUP_EXPAND,
                             FILTER_MAIL};
    std::mt19937 random(715);
    int iKeptSomething = 0;
    for (int iRound = 0; iRound < 200; ++iRound)
    {
        Records vRecords(random() % 60);
        std::for_each(vRecords.begin(), vRecords.end(),
                      [&random](auto& record) { FillRandomly(random, &record); });
        int piKinds[] = {KINDS[random() % 5], KINDS[random() % 5]};
        QVLong32 plIds[] = {static_cast<QVLong32>(random() % 5), 1};
        CFilterChain* pChain = nullptr;
        ASSERT_EQ(m_store.CreateFilterChain(piKinds, plIds, 2, &pChain), 0);
        const std::unique_ptr<CFilterChain> chain(pChain);
        const int iNum = static_cast<int>(vRecords.size());
        std::vector<tag_LocalizerDetail> vEntries(vRecords.size());
        const int iKept = CCandidateEntries::Select(vRecords.data(), iNum, false, *pChain, nullptr,
                                                    vEntries.data())
                              .iKept;
        tag_ContactsInfo copy = {iNum, vRecords.data()};
        const Set set = Own(new tag_LocalizerResult());
        CCandidateEntries::NarrowCopy(&copy, *pChain, set.get());
        ASSERT_EQ(iKept, set->iResultNum) << iRound;
        ASSERT_EQ(EntryBytes(vEntries.data(), iKept), EntryBytes(set->pDetail, iKept)) << iRound;
        iKeptSomething += iKept > 0 ? 1 : 0;
    }
    EXPECT_GT(iKeptSomething, 70) << "the test has to test something";
}

TEST_F(SearchResults, MakesSetsOfTheSameSize)
{
    tag_LocalizerDetail pEntries[2] = {};
    pEntries[1].iContactID = 100;
    tag_LocalizerResult source = {2, pEntries};
    tag_LocalizerResult* pSet = nullptr;
    EXPECT_EQ(m_store.NewSearchResult(&source, &pSet), 0);
    Set set = Own(pSet);
    EXPECT_EQ(EntryBytes(set->pDetail, set->iResultNum), std::string(2 * 88, '\0'));
    EXPECT_EQ(m_store.CopySearchResult(&source, &pSet), 0);
    set = Own(pSet);
    EXPECT_EQ(EntryBytes(set->pDetail, set->iResultNum), EntryBytes(pEntries, 2));
    const CMemoryFailure failure(1);
    EXPECT_EQ(m_store.CopySearchResult(&source, &pSet), -1);
    EXPECT_EQ(pSet, nullptr);
    EXPECT_EQ(m_log.Texts(ERROR_LINE), Lines{"QV_Contacts: CopySearchResult malloc mem error"});
}

TEST_F(SearchResults, PagesAreViews)
{
    tag_LocalizerDetail pEntries[10] = {};
    tag_LocalizerResult set = {10, pEntries};
    tag_LocalizerResult page = {};
    EXPECT_EQ(m_store.GetSearchRecord(&set, 9, 1, &page), 0);
    EXPECT_EQ(page.iResultNum, 1);
    EXPECT_EQ(page.pDetail, pEntries + 9);
    const int pages[][2] = {{10, 0}, {5, 6}, {-1, 1}, {0, -1}, {5, INT32_MAX}, {INT32_MAX, 1}};
    for (const auto& [iStart, iCount] : pages)
    {
        EXPECT_EQ(m_store.GetSearchRecord(&set, iStart, iCount, &page), -1) << iStart;
        EXPECT_EQ(page.pDetail, pEntries + 9) << iStart;
    }
}

TEST_F(SearchResults, CountsIndexCharacters)
{
    constexpr int32_t WORDS[] = {'A', 'Z', '1', '5', '#', '0', '6', '@', '[', -1, INT32_MIN};
    std::vector<tag_LocalizerDetail> vEntries(std::size(WORDS));
    for (size_t i = 0; i < vEntries.size(); ++i)
    {
        vEntries[i].iFirstWord = WORDS[i];
    }
    tag_LocalizerResult set = {static_cast<int32_t>(vEntries.size()), vEntries.data()};
    int piCounts[28] = {};
    EXPECT_EQ(m_store.GetFirstWordInfo(&set, piCounts), 0);
    EXPECT_EQ(piCounts[0] + piCounts[25], 2);
    EXPECT_EQ(piCounts[26], 9);
    EXPECT_EQ(piCounts[27], 0);

    SetReg({0, STORE_ORDER_TIME, 0});
    int piSections[7] = {};
    EXPECT_EQ(m_store.GetFirstWordInfo(&set, piSections), 0);
    const int piExpectedSections[7] = {1, 0, 0, 0, 1, 9, 0};
    EXPECT_TRUE(std::equal(piSections, piSections + 7, piExpectedSections));
}

} // namespace
