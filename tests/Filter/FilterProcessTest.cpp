#include "Filter/FilterProcess.h"

#include <gtest/gtest.h>

#include <typeinfo>

#include "Filter/AccountExpandFilterProcess.h"
#include "Filter/AccountFilterProcess.h"
#include "Filter/ContactIdExpandFilterProcess.h"
#include "Filter/FavouritesFilterProcess.h"
#include "Filter/FilterProcessFactory.h"
#include "Filter/GroupExpandFilterProcess.h"
#include "Filter/GroupFilterProcess.h"
#include "Filter/MailFilterProcess.h"
#include "Filter/OnlineFilterProcess.h"
#include "Filter/PhoneFilterProcess.h"
#include "Filter/PostalFilterProcess.h"
#include "tests/Filter/FilterTestSupport.h"
#include "tests/Support/LogCapture.h"
#include "tests/Support/MemoryFailure.h"

namespace
{

constexpr int STUB_RESULT = 7;

// A last process that counts its runs and deletions.
class CStubProcess : public FilterProcess
{
public:
    explicit CStubProcess(int* piDeleted) : m_piDeleted(piDeleted) {}
    ~CStubProcess() override { ++*m_piDeleted; }
    int FilterRecord(tag_ContactsInfo* /*pInfo*/, CFilterChain& /*chain*/) override
    {
        ++m_iRuns;
        return STUB_RESULT;
    }

    int m_iRuns = 0;

private:
    int* m_piDeleted;
};

tag_LogLine AccountSumLine(int iSum)
{
    return {3, "Filter/AccountExpandFilterProcess",
            "QV_Contacts: IsSameAccountEx ACCOUNT SUM= " + std::to_string(iSum) + "\n"};
}

const tag_LogLine ONLINE_LINE = {3, "Filter/OnlineFilterProcess",
                                 "OnlineFilterProcess: find one contact is  sms online\n"};

TEST(MembershipTests, CompareEachElementBeforeItEndsTheList)
{
    const struct
    {
        int iID;
        IdList vList;
        int iNum;
        int iExpected;
    } CASES[] = {
        {4, {4, 0}, 2, 1},
        {9, {4, 9, 0}, 3, 1},
        {9, {4, 0, 9}, 3, 0},
        {0, {4, 9, 0}, 3, 1},
        {0, {4, 9, 0}, 2, 0},
        {0, {0}, 1, 1},
        {5, {4, 9, 7}, 3, 0},
        {7, {4, 9, 7}, 3, 1},
        {7, {4, 9, 7}, 2, 0},
        {-1, {3, -1, 0}, 3, 1},
        {4, {4}, 0, 0},
        {4, {4}, -1, 0},
        {INT32_MIN, {INT32_MIN}, 1, 1},
    };
    for (const auto& item : CASES)
    {
        const QVLong32* plList = item.vList.data();
        EXPECT_EQ(GroupFilterProcess::IsSameGroup(item.iID, plList, item.iNum), item.iExpected)
            << item.iID;
        EXPECT_EQ(AccountFilterProcess::IsSameAccount(item.iID, plList, item.iNum), item.iExpected)
            << item.iID;
    }
}

TEST(MembershipTests, AccountExpandLooksAtTheWholeChain)
{
    const struct
    {
        int iID;
        IdList vList;
        IdList vExcluded;
        int iExpected;
        int iLoggedSum; // -1: no line
    } CASES[] = {
        {3, {3}, {3}, 1, -1},
        {3, {5}, {3, 5}, 0, -1}, // one account: only the filter's own id counts
        {5, {5, 0, 3}, {}, 1, -1},
        {3, {}, {3}, 0, 0},
        {0, {}, {0}, 0, 0},
        {3, {3, 5}, {3, 5}, 1, 2},
        {3, {3, 5}, {3}, 0, 2},
        {8, {3, 5}, {5, 8, 3}, 1, 2}, // several accounts: the filter's own id does not count
        {3, {3, 5, 7}, {3, 5}, 0, 3},
        {3, {3, 5}, {}, 0, 2},
    };
    for (const auto& item : CASES)
    {
        std::vector<KindAndId> vFilters = {{FILTER_GROUP, 7}}; // not an excluded account
        for (QVLong32 lID : item.vExcluded)
        {
            vFilters.emplace_back(FILTER_ACCOUNT_EXPAND, lID);
        }
        const std::unique_ptr<CFilterChain> pChain = MakeChain(vFilters);
        pChain->SetFilter(nullptr);
        const tag_ContactsStruct record = MakeContact(1, {}, item.vList, 0);
        const CLogCapture log;
        const CMemoryFailure failure(0);
        EXPECT_EQ(AccountExpandFilterProcess::IsSameAccountEx(item.iID, record.lAccountID,
                                                              CONTACT_MAX_ACCOUNTS, *pChain),
                  item.iExpected)
            << testing::PrintToString(item.vList);
        std::vector<tag_LogLine> vExpected;
        if (item.iLoggedSum >= 0)
        {
            vExpected.push_back(AccountSumLine(item.iLoggedSum));
        }
        EXPECT_EQ(log.Lines(), vExpected);
    }
}

TEST(MembershipTests, AccountExpandStopsAtTheEndOfAFullList)
{
    const tag_ContactsStruct record = MakeContact(1, {}, IdList(CONTACT_MAX_ACCOUNTS, 3), 0);
    const std::unique_ptr<CFilterChain> pChain = MakeChain({{FILTER_ACCOUNT_EXPAND, 3}});
    const CLogCapture log;
    EXPECT_EQ(AccountExpandFilterProcess::IsSameAccountEx(3, record.lAccountID,
                                                          CONTACT_MAX_ACCOUNTS, *pChain),
              1);
    EXPECT_EQ(AccountExpandFilterProcess::IsSameAccountEx(3, record.lAccountID, 0, *pChain), 0);
    EXPECT_EQ(log.Lines(),
              (std::vector<tag_LogLine>{AccountSumLine(CONTACT_MAX_ACCOUNTS), AccountSumLine(0)}));
}

TEST(FilterProcess, HandsOnUnlessThereIsNoSet)
{
    int iDeleted = 0;
    CStubProcess* pNext = new CStubProcess(&iDeleted);
    {
        PhoneFilterProcess process;
        process.m_pNext = pNext;
        CFilterChain chain;
        tag_ContactsInfo info = {0, nullptr};
        EXPECT_EQ(process.FilterRecord(nullptr, chain), -1);
        EXPECT_EQ(pNext->m_iRuns, 0);
        EXPECT_EQ(process.FilterRecord(&info, chain), STUB_RESULT);
        EXPECT_EQ(pNext->m_iRuns, 1);
    }
    EXPECT_EQ(iDeleted, 1);
}

TEST(FilterProcess, DeletesADeepPipelineOnceOnASmallStack)
{
    constexpr int DEPTH = 1000000;
    int iDeleted = 0;
    std::unique_ptr<FilterProcess> pFirst;
    for (int i = 0; i < DEPTH; ++i)
    {
        FilterProcess* pProcess = new CStubProcess(&iDeleted);
        pProcess->m_pNext = pFirst.release();
        pFirst.reset(pProcess);
    }
    pFirst.reset();
    EXPECT_EQ(iDeleted, DEPTH);
}

TEST(FilterProcessFactory, LinksAllProcessesInOrder)
{
    const std::type_info* const apExpected[] = {
        &typeid(AccountFilterProcess),         &typeid(AccountExpandFilterProcess),
        &typeid(GroupFilterProcess),           &typeid(GroupExpandFilterProcess),
        &typeid(PhoneFilterProcess),           &typeid(MailFilterProcess),
        &typeid(FavouritesFilterProcess),      &typeid(PostalFilterProcess),
        &typeid(ContactIdExpandFilterProcess), &typeid(OnlineFilterProcess),
    };
    const std::unique_ptr<FilterProcess> pFirst(FilterProcessFactory::CreateFilterProcess());
    const FilterProcess* pProcess = pFirst.get();
    for (const std::type_info* pExpected : apExpected)
    {
        ASSERT_NE(pProcess, nullptr);
        EXPECT_STREQ(typeid(*pProcess).name(), pExpected->name());
        pProcess = pProcess->m_pNext;
    }
    EXPECT_EQ(pProcess, nullptr);
}

// The sanitizers see a process that is not freed.
TEST(FilterProcessFactory, MakesNoShorterPipeline)
{
    for (int iGranted = 0; iGranted <= 10; ++iGranted)
    {
        std::unique_ptr<FilterProcess> pFirst;
        {
            const CMemoryFailure failure(iGranted);
            pFirst.reset(FilterProcessFactory::CreateFilterProcess());
        }
        EXPECT_EQ(pFirst != nullptr, iGranted == 10) << iGranted;
    }
}

class CPipeline : public testing::Test
{
protected:
    // Ids of the contacts that are left, in order.
    std::vector<int> Survivors(const std::vector<KindAndId>& vFilters)
    {
        Records vRecords = m_vRecords;
        int iCount = -1;
        EXPECT_EQ(RunPipeline(*m_pFirst, *MakeChain(vFilters), vRecords, &iCount), 0);
        std::vector<int> vIDs(static_cast<size_t>(iCount));
        std::transform(vRecords.begin(), vRecords.begin() + iCount, vIDs.begin(),
                       [](const tag_ContactsStruct& record) { return record.iContactID; });
        return vIDs;
    }

    const std::unique_ptr<FilterProcess> m_pFirst{FilterProcessFactory::CreateFilterProcess()};
    const Records m_vRecords = {
        MakeContact(1, {4}, {3}, CONTACT_FLAG_PHONE),
        MakeContact(2, {9, 4}, {3, 5}, CONTACT_FLAG_MAIL | CONTACT_FLAG_ONLINE),
        MakeContact(3, {4, 9, -1}, {}, CONTACT_FLAG_SECRET | CONTACT_FLAG_STARRED),
        MakeContact(4, {}, {5}, CONTACT_FLAG_ADDRESS | CONTACT_FLAG_ONLINE),
        MakeContact(5, {-1}, {3, 5, 7}, ~0U & ~CONTACT_FLAG_ONLINE),
        MakeContact(6, IdList(CONTACT_MAX_GROUPS, 4), IdList(CONTACT_MAX_ACCOUNTS, 5), 0),
    };
};

TEST_F(CPipeline, KeepsTheContactsThatPassEveryFilter)
{
    const struct
    {
        std::vector<KindAndId> vFilters;
        std::vector<int> vExpected;
    } CASES[] = {
        {{}, {1, 2, 3, 4, 5, 6}},
        {{{3, 4}, {12, 4}}, {1, 2, 3, 4, 5, 6}},
        {{{FILTER_GROUP, 4}}, {1, 2, 3, 6}},
        {{{FILTER_GROUP, 4}, {FILTER_GROUP, 9}}, {2, 3}},
        {{{FILTER_GROUP, SECRET_GROUP_ID}}, {3, 5}},
        {{{FILTER_GROUP_EXPAND, SECRET_GROUP_ID}}, {1, 2, 4, 6}},
        {{{FILTER_GROUP, 0}}, {1, 2, 3, 4, 5}}, // a full list has no 0
        {{{FILTER_GROUP_EXPAND, 0}}, {6}},
        {{{FILTER_GROUP_EXPAND, 4}, {FILTER_GROUP_EXPAND, -1}}, {4}},
        {{{FILTER_ACCOUNT, 3}}, {1, 2, 5}},
        {{{FILTER_ACCOUNT, 0}}, {1, 2, 3, 4, 5}},
        {{{FILTER_ACCOUNT, 3}, {FILTER_ACCOUNT, 7}}, {5}},
        {{{FILTER_ACCOUNT_EXPAND, 3}}, {2, 3, 4, 5, 6}},
        {{{FILTER_ACCOUNT_EXPAND, 3}, {FILTER_ACCOUNT_EXPAND, 5}}, {3, 5}},
        {{{FILTER_PHONE, 0}}, {1, 5}},
        {{{FILTER_MAIL, 0}}, {2, 5}},
        {{{FILTER_FAVOURITES, 0}}, {3, 5}},
        {{{FILTER_POSTAL, 0}}, {4, 5}},
        {{{FILTER_ONLINE, 0}}, {2, 4}},
        {{{FILTER_CONTACT_ID_EXPAND, 99}}, {1, 2, 3, 4, 5, 6}},
        {{{FILTER_CONTACT_ID_EXPAND, 3}, {FILTER_CONTACT_ID_EXPAND, 6}}, {1, 2, 4, 5}},
        {{{FILTER_ONLINE, 0}, {FILTER_MAIL, 0}, {FILTER_GROUP, 9}}, {2}},
        {{{FILTER_ONLINE, 0}, {FILTER_PHONE, 0}}, {}},
    };
    for (const auto& item : CASES)
    {
        EXPECT_EQ(Survivors(item.vFilters), item.vExpected)
            << testing::PrintToString(item.vFilters);
    }
}

TEST_F(CPipeline, LogsEachKeptOnlineContactAndEachContactOfSeveralAccounts)
{
    const CLogCapture log;
    Survivors({{FILTER_ONLINE, 0}, {FILTER_ACCOUNT_EXPAND, 3}});
    EXPECT_EQ(log.Lines(),
              (std::vector<tag_LogLine>{AccountSumLine(2), AccountSumLine(0), AccountSumLine(3),
                                        AccountSumLine(20), ONLINE_LINE, ONLINE_LINE}));
}

TEST_F(CPipeline, TakesASetWithoutRecords)
{
    const std::unique_ptr<CFilterChain> pChain = MakeChain({{FILTER_PHONE, 0}});
    for (int iNum : {0, 5, -3})
    {
        tag_ContactsInfo info = {iNum, nullptr};
        EXPECT_EQ(m_pFirst->FilterRecord(&info, *pChain), 0);
        EXPECT_EQ(info.RecordNum, 0);
    }
    EXPECT_EQ(m_pFirst->FilterRecord(nullptr, *pChain), -1);
}

} // namespace
