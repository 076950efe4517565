// Which records each kind of filter keeps, by the pipeline with and without memory and by the test
// of single records; the chain that holds the filters.

#include <gtest/gtest.h>

#include <algorithm>
#include <iterator>
#include <memory>
#include <type_traits>
#include <utility>
#include <vector>

#include "Filter/AccountExpandFilterProcess.h"
#include "Filter/AccountFilterProcess.h"
#include "Filter/FilterChain.h"
#include "Filter/FilterChainBuilder.h"
#include "Filter/FilterProcessFactory.h"
#include "Filter/GroupFilterProcess.h"
#include "Filter/RecordRule.h"
#include "tests/Support/LogCapture.h"
#include "tests/Support/MemoryFailure.h"

namespace
{

static_assert(!std::is_copy_constructible<CFilterChain>::value, "two chains would delete twice");

using Chain = std::unique_ptr<CFilterChain>;
using Ids = std::vector<int>;
using Records = std::vector<tag_ContactsStruct>;

// Contacts 1 to 6 have one flag each and neither groups nor accounts; the others have lists: 7
// short ones, 8 such as fill all places, 9 with ids behind the end.
Records MakeRecords()
{
    constexpr uint32_t FLAGS[] = {CONTACT_FLAG_PHONE,   CONTACT_FLAG_MAIL,   CONTACT_FLAG_STARRED,
                                  CONTACT_FLAG_ADDRESS, CONTACT_FLAG_ONLINE, CONTACT_FLAG_SECRET};
    Records vRecords(9, tag_ContactsStruct{});
    for (size_t i = 0; i < vRecords.size(); ++i)
    {
        vRecords[i].iContactID = static_cast<int32_t>(i) + 1;
        vRecords[i].iFlags = i < std::size(FLAGS) ? FLAGS[i] : 0;
    }
    const auto fnFill = [](tag_ContactsStruct& record, const std::vector<QVLong32>& vIds)
    {
        std::copy(vIds.begin(), vIds.end(), record.lGroupID);
        std::copy(vIds.begin(), vIds.end(), record.lAccountID);
    };
    fnFill(vRecords[6], {3});
    fnFill(vRecords[8], {-1, 3, 0, 9});
    std::fill(std::begin(vRecords[7].lGroupID), std::end(vRecords[7].lGroupID), 3);
    std::fill(std::begin(vRecords[7].lAccountID), std::end(vRecords[7].lAccountID), 3);
    *std::rbegin(vRecords[7].lGroupID) = *std::rbegin(vRecords[7].lAccountID) = 9;
    return vRecords;
}

struct tag_Row
{
    std::vector<int> vKinds;
    std::vector<QVLong32> vIds;
    Ids vKept;
    Ids vLogged; // per log line the number of accounts, or FOUND_ONLINE
};

constexpr int FOUND_ONLINE = -1;
const Ids ALL = {1, 2, 3, 4, 5, 6, 7, 8, 9};
const Ids UNFILLED = {1, 2, 3, 4, 5, 6, 7, 9};
const Ids ACCOUNTS_OF_ALL = {0, 0, 0, 0, 0, 0, 20, 2};

const tag_Row ROWS[] = {
    {{3, 4, -1, 12}, {9, 9, 9, 9}, ALL, {}},
    {{FILTER_PHONE}, {0}, {1}, {}},
    {{FILTER_MAIL}, {0}, {2}, {}},
    {{FILTER_FAVOURITES}, {0}, {3}, {}},
    {{FILTER_POSTAL}, {0}, {4}, {}},
    {{FILTER_ONLINE}, {0}, {5}, {FOUND_ONLINE}},
    {{FILTER_GROUP}, {3}, {7, 8, 9}, {}},
    {{FILTER_GROUP}, {9}, {8}, {}},
    {{FILTER_GROUP}, {0}, UNFILLED, {}}, // found in a list that leaves a place free
    {{FILTER_GROUP_EXPAND}, {-1}, {1, 2, 3, 4, 5, 6, 7, 8}, {}},
    {{FILTER_GROUP_EXPAND}, {9}, UNFILLED, {}},
    {{FILTER_ACCOUNT}, {3}, {7, 8, 9}, {}},
    {{FILTER_ACCOUNT}, {9}, {8}, {}},
    {{FILTER_ACCOUNT}, {0}, UNFILLED, {}},
    {{FILTER_CONTACT_ID_EXPAND}, {8}, UNFILLED, {}},
    // Both of several have to hold.
    {{FILTER_GROUP, FILTER_GROUP}, {3, -1}, {9}, {}},
    {{FILTER_CONTACT_ID_EXPAND, FILTER_GROUP}, {9, 3}, {7, 8}, {}},
    // The excluded accounts count together for contacts with several.
    {{FILTER_ACCOUNT_EXPAND}, {3}, {1, 2, 3, 4, 5, 6, 8, 9}, ACCOUNTS_OF_ALL},
    {{FILTER_ACCOUNT_EXPAND, FILTER_ACCOUNT_EXPAND},
     {3, -1},
     {1, 2, 3, 4, 5, 6, 8},
     {0, 0, 0, 0, 0, 0, 20, 2, 0, 0, 0, 0, 0, 0, 20}},
    // The pipeline asks for accounts first and for the online state last.
    {{FILTER_GROUP, FILTER_ACCOUNT_EXPAND, FILTER_ACCOUNT}, {0, 4, -1}, {9}, {2}},
    {{FILTER_GROUP, FILTER_ACCOUNT_EXPAND}, {9, 3}, {8}, ACCOUNTS_OF_ALL},
    {{FILTER_ONLINE, FILTER_CONTACT_ID_EXPAND}, {0, 5}, {}, {}},
};

std::vector<tag_LogLine> LinesOf(const Ids& vLogged)
{
    std::vector<tag_LogLine> vLines;
    for (const int iAccounts : vLogged)
    {
        vLines.push_back(iAccounts == FOUND_ONLINE
                             ? tag_LogLine{DEBUG_LINE, "Filter/OnlineFilterProcess",
                                           "OnlineFilterProcess: find one contact is  sms online\n"}
                             : tag_LogLine{DEBUG_LINE, "Filter/AccountExpandFilterProcess",
                                           "QV_Contacts: IsSameAccountEx ACCOUNT SUM= " +
                                               std::to_string(iAccounts) + "\n"});
    }
    return vLines;
}

Chain Build(const tag_Row& row)
{
    CFilterChain* pChain = nullptr;
    const int iNum = static_cast<int>(row.vKinds.size());
    EXPECT_EQ(BuildFilterChain(row.vKinds.data(), row.vIds.data(), iNum, &pChain), 0);
    return Chain(pChain);
}

class CCountedFilter : public CFilter
{
public:
    explicit CCountedFilter(int* piDeleted) : CFilter(FILTER_PHONE), m_piDeleted(piDeleted) {}
    ~CCountedFilter() override { ++*m_piDeleted; }

private:
    int* m_piDeleted;
};

} // namespace

TEST(Filters, KeepTheirContacts)
{
    const std::unique_ptr<FilterProcess> first(FilterProcessFactory::CreateFilterProcess());
    for (const tag_Row& row : ROWS)
    {
        SCOPED_TRACE(testing::PrintToString(row.vKinds) + testing::PrintToString(row.vIds));
        const Chain chain = Build(row);
        const bool bLogs =
            std::any_of(row.vKinds.begin(), row.vKinds.end(),
                        [](int iKind) { return iKind == 9 || iKind == FILTER_ONLINE; });
        EXPECT_EQ(CRecordRule::CanTest(*chain), !bLogs);
        chain->SetFilter(nullptr);
        Ids vKept;
        for (const tag_ContactsStruct& record : MakeRecords())
        {
            if (CRecordRule(*chain).Keeps(record))
            {
                vKept.push_back(record.iContactID);
            }
        }
        EXPECT_EQ(vKept, row.vKept);
        for (const int iGranted : {1000, 1, 0}) // without memory the records move at once
        {
            Records vRecords = MakeRecords();
            tag_ContactsInfo info = {static_cast<int32_t>(vRecords.size()), vRecords.data()};
            const CLogCapture log;
            {
                const CMemoryFailure failure(iGranted);
                EXPECT_EQ(first->FilterRecord(&info, *chain), 0);
            }
            vKept.clear();
            std::transform(info.pContacts, info.pContacts + info.RecordNum,
                           std::back_inserter(vKept),
                           [](const tag_ContactsStruct& record) { return record.iContactID; });
            EXPECT_EQ(vKept, row.vKept) << iGranted;
            EXPECT_EQ(log.Lines(), LinesOf(row.vLogged)) << iGranted;
        }
    }
    const Chain mail = Build({{FILTER_MAIL}, {0}, {}, {}});
    for (const int iNum : {0, 5, -3})
    {
        tag_ContactsInfo info = {iNum, nullptr};
        EXPECT_EQ(first->FilterRecord(&info, *mail), 0);
        EXPECT_EQ(info.RecordNum, 0);
    }
    EXPECT_EQ(first->FilterRecord(nullptr, *mail), -1);
}

// The membership operations as programs call them, on an object and with lists of their own.
TEST(Filters, ReadAListUpToItsFirstZeroOrItsLength)
{
    QVLong32 lList[] = {3, 5, 0, 9};
    const int LISTS[][4] = {
        // id, length of the list, whether it is a member, whether 3 and it are all
        {3, 4, 1, 0}, {5, 4, 1, 1}, {9, 4, 0, 0}, {0, 4, 1, 0}, {0, 2, 0, 0},
        {5, 1, 0, 0}, {3, 1, 1, 1}, {3, 0, 0, 0}, {0, -1, 0, 0}};
    for (const auto& [iID, iNum, iMember, iConfined] : LISTS)
    {
        const Chain chain =
            Build({{FILTER_ACCOUNT_EXPAND, FILTER_ACCOUNT_EXPAND}, {3, iID}, {}, {}});
        EXPECT_EQ(GroupFilterProcess().IsSameGroup(iID, lList, iNum), iMember);
        EXPECT_EQ(AccountFilterProcess().IsSameAccount(iID, lList, iNum), iMember);
        EXPECT_EQ(AccountExpandFilterProcess().IsSameAccountEx(iID, lList, iNum, *chain),
                  iConfined);
    }
}

TEST(FilterChain, DeletesEachFilterOnceAlsoOneThatFindsNoPlace)
{
    constexpr int FILTER_NUM = 40;
    int iDeleted = 0;
    {
        CFilterChain chain;
        for (int i = 0; i < FILTER_NUM; ++i)
        {
            chain.SetFilter(new CCountedFilter(&iDeleted));
        }
        EXPECT_EQ(iDeleted, 0);
        EXPECT_NE(chain.GetFilterByNo(FILTER_NUM - 1), nullptr);
        EXPECT_EQ(chain.GetFilterByNo(-1), nullptr);
        EXPECT_EQ(chain.GetFilterByNo(FILTER_NUM), nullptr);
    }
    EXPECT_EQ(iDeleted, FILTER_NUM);
    CFilterChain chain;
    CFilter* pFilter = new CCountedFilter(&iDeleted);
    {
        const CMemoryFailure failure(0);
        chain.SetFilter(pFilter);
    }
    EXPECT_EQ(iDeleted, FILTER_NUM + 1);
}

// Memory goes to the chain, the group filter, the chain's places and the online filter, and to the
// ten processes of a pipeline.
TEST(FilterChain, IsRefusedOrCutWithoutArgumentsOrMemory)
{
    const int aiType[] = {3, FILTER_GROUP, FILTER_ONLINE};
    const QVLong32 alID[] = {0, 4, 0};
    CFilterChain untouched;
    CFilterChain* pChain = &untouched;
    EXPECT_EQ(BuildFilterChain(nullptr, alID, 1, &pChain), -1);
    EXPECT_EQ(BuildFilterChain(aiType, nullptr, 1, &pChain), -1);
    EXPECT_EQ(BuildFilterChain(aiType, alID, 1, nullptr), -1);
    EXPECT_EQ(pChain, &untouched);
    constexpr int NO_CHAIN = -1;
    const int aiFilters[] = {NO_CHAIN, 0, 0, 1, 2, 2, 2, 2, 2, 2, 2};
    for (int iGranted = 0; iGranted <= 10; ++iGranted)
    {
        SCOPED_TRACE(iGranted);
        pChain = &untouched;
        int iResult = 0;
        std::unique_ptr<FilterProcess> first;
        {
            const CMemoryFailure failure(iGranted);
            iResult = BuildFilterChain(aiType, alID, 3, &pChain);
        }
        {
            const CMemoryFailure failure(iGranted);
            first.reset(FilterProcessFactory::CreateFilterProcess());
        }
        ASSERT_NE(pChain, &untouched);
        const Chain chain(pChain);
        EXPECT_EQ(iResult, iGranted < 4 ? -1 : 0);
        EXPECT_EQ(chain ? chain->GetFilterNum() : NO_CHAIN, aiFilters[iGranted]);
        EXPECT_EQ(first != nullptr, iGranted == 10);
    }
    EXPECT_EQ(BuildFilterChain(aiType, alID, INT32_MIN, &pChain), 0);
    EXPECT_EQ(Chain(pChain)->GetFilterNum(), 0);
}
