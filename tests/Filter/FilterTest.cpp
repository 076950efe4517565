// Which records each kind of filter keeps, by the pipeline and by the test of single records; the
// chain that holds the filters.

#include "Filter/AccountExpandFilterProcess.h"
#include "Filter/AccountFilterProcess.h"
#include "Filter/FilterChain.h"
#include "Filter/FilterChainBuilder.h"
#include "Filter/FilterProcessFactory.h"
#include "Filter/GroupFilterProcess.h"
#include "Filter/RecordRule.h"
#include "tests/Support/DataDirectory.h"
#include "tests/Support/LogCapture.h"
#include "tests/Support/MemoryFailure.h"

#include <algorithm>
#include <gtest/gtest.h>
#include <iterator>
#include <memory>
#include <string>
#include <utility>
#include <vector>

namespace
{

using Chain = std::unique_ptr<CFilterChain>;
using Kinds = std::vector<std::pair<int, QVLong32>>; // each with an id
using Records = std::vector<tag_ContactsStruct>;

// Contacts 1 to 6 have one flag each and neither groups nor accounts; the others have lists: 7
// short ones, 8 such as fill all places, 9 with ids behind the end.
Records MakeRecords()
{
    constexpr uint32_t FLAGS[9] = {CONTACT_FLAG_PHONE,   CONTACT_FLAG_MAIL,   CONTACT_FLAG_STARRED,
                                   CONTACT_FLAG_ADDRESS, CONTACT_FLAG_ONLINE, CONTACT_FLAG_SECRET};
    Records vRecords(9, tag_ContactsStruct{});
    for (size_t i = 0; i < 9; ++i)
    {
        vRecords[i].iContactID = static_cast<int32_t>(i) + 1;
        vRecords[i].iFlags = FLAGS[i];
    }
    vRecords[6].lGroupID[0] = vRecords[6].lAccountID[0] = 3;
    std::fill(std::begin(vRecords[7].lGroupID), std::end(vRecords[7].lGroupID) - 1, 3);
    std::fill(std::begin(vRecords[7].lAccountID), std::end(vRecords[7].lAccountID) - 1, 3);
    *std::rbegin(vRecords[7].lGroupID) = *std::rbegin(vRecords[7].lAccountID) = 9;
    const QVLong32 CUT[] = {-1, 3, 0, 9};
    std::copy(std::begin(CUT), std::end(CUT), vRecords[8].lGroupID);
    std::copy(std::begin(CUT), std::end(CUT), vRecords[8].lAccountID);
    return vRecords;
}

// Filters and the contacts that they keep.
const struct
{
    Kinds vKinds;
    std::string strKept;
} ROWS[] = {
    {{{3, 9}, {4, 9}, {-1, 9}, {12, 9}}, "123456789"},
    {{{FILTER_PHONE, 0}}, "1"},
    {{{FILTER_MAIL, 0}}, "2"},
    {{{FILTER_FAVOURITES, 0}}, "3"},
    {{{FILTER_POSTAL, 0}}, "4"},
    {{{FILTER_ONLINE, 0}}, "5"},
    {{{FILTER_GROUP, 3}}, "789"},
    {{{FILTER_GROUP, 9}}, "8"},
    {{{FILTER_GROUP, 0}}, "12345679"}, // found in a list that leaves a place free
    {{{FILTER_GROUP_EXPAND, -1}}, "12345678"},
    {{{FILTER_GROUP_EXPAND, 9}}, "12345679"},
    {{{FILTER_ACCOUNT, 3}}, "789"},
    {{{FILTER_ACCOUNT, 9}}, "8"},
    {{{FILTER_ACCOUNT, 0}}, "12345679"},
    {{{FILTER_CONTACT_ID_EXPAND, 8}}, "12345679"},
    // Both of several have to hold.
    {{{FILTER_GROUP, 3}, {FILTER_GROUP, -1}}, "9"},
    {{{FILTER_CONTACT_ID_EXPAND, 9}, {FILTER_GROUP, 3}}, "78"},
    // The excluded accounts count together for contacts with several.
    {{{FILTER_ACCOUNT_EXPAND, 3}}, "12345689"},
    {{{FILTER_ACCOUNT_EXPAND, 3}, {FILTER_ACCOUNT_EXPAND, -1}}, "1234568"},
    // The pipeline asks for accounts first and for the online state last.
    {{{FILTER_GROUP, 0}, {FILTER_ACCOUNT_EXPAND, 4}, {FILTER_ACCOUNT, -1}}, "9"},
    {{{FILTER_GROUP, 9}, {FILTER_ACCOUNT_EXPAND, 3}}, "8"},
    {{{FILTER_ONLINE, 0}, {FILTER_CONTACT_ID_EXPAND, 5}}, ""},
};

Chain Build(const Kinds& vKinds)
{
    std::vector<int> vTypes;
    std::vector<QVLong32> vIds;
    for (const auto& [iKind, lId] : vKinds)
    {
        vTypes.push_back(iKind);
        vIds.push_back(lId);
    }
    CFilterChain* pChain = nullptr;
    const int iNum = static_cast<int>(vKinds.size());
    EXPECT_EQ(BuildFilterChain(vTypes.data(), vIds.data(), iNum, &pChain), 0);
    return Chain(pChain);
}

} // namespace

TEST(Filters, KeepTheirContacts)
{
    const std::unique_ptr<FilterProcess> first(FilterProcessFactory::CreateFilterProcess());
    CLogCapture log;
    std::string strTold;
    for (const auto& row : ROWS)
    {
        SCOPED_TRACE(testing::PrintToString(row.vKinds));
        const Chain chain = Build(row.vKinds);
        EXPECT_EQ(CRecordRule::CanTest(*chain),
                  std::none_of(row.vKinds.begin(), row.vKinds.end(),
                               [](const auto& kind)
                               { return kind.first == 9 || kind.first == FILTER_ONLINE; }));
        chain->SetFilter(nullptr);
        std::string strKept;
        for (const tag_ContactsStruct& record : MakeRecords())
        {
            strKept += CRecordRule(*chain).Keeps(record) ? std::to_string(record.iContactID) : "";
        }
        EXPECT_EQ(strKept, row.strKept);
        Records vRecords = MakeRecords();
        tag_ContactsInfo info = {static_cast<int32_t>(vRecords.size()), vRecords.data()};
        log.Clear();
        EXPECT_EQ(first->FilterRecord(&info, *chain), 0);
        strKept.clear();
        for (int i = 0; i < info.RecordNum; ++i)
        {
            strKept += std::to_string(info.pContacts[i].iContactID);
        }
        EXPECT_EQ(strKept, row.strKept);
        strTold += testing::PrintToString(row.vKinds) + "\n" + log.Take();
    }
    EXPECT_EQ(strTold, CDataDirectory::ReadBytes(QV_TEST_DATA "/Filter/log.txt"));
    const Chain mail = Build({{FILTER_MAIL, 0}});
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
        const Chain chain = Build({{FILTER_ACCOUNT_EXPAND, 3}, {FILTER_ACCOUNT_EXPAND, iID}});
        EXPECT_EQ(GroupFilterProcess().IsSameGroup(iID, lList, iNum), iMember);
        EXPECT_EQ(AccountFilterProcess().IsSameAccount(iID, lList, iNum), iMember);
        EXPECT_EQ(AccountExpandFilterProcess().IsSameAccountEx(iID, lList, iNum, *chain),
                  iConfined);
    }
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
        const int iResult =
            WithMemoryFor(iGranted, [&] { return BuildFilterChain(aiType, alID, 3, &pChain); });
        const std::unique_ptr<FilterProcess> first(
            WithMemoryFor(iGranted, &FilterProcessFactory::CreateFilterProcess));
        ASSERT_NE(pChain, &untouched);
        const Chain chain(pChain);
        EXPECT_EQ(iResult, iGranted < 4 ? -1 : 0);
        const int iFilters = chain ? chain->GetFilterNum() : NO_CHAIN;
        EXPECT_EQ(iFilters, aiFilters[iGranted]);
        EXPECT_TRUE(iFilters < 0 || chain->GetFilterByNo(iFilters) == nullptr);
        EXPECT_TRUE(iFilters < 0 || chain->GetFilterByNo(-1) == nullptr);
        EXPECT_EQ(first != nullptr, iGranted == 10);
    }
    EXPECT_EQ(BuildFilterChain(aiType, alID, INT32_MIN, &pChain), 0);
    EXPECT_EQ(Chain(pChain)->GetFilterNum(), 0);
}
