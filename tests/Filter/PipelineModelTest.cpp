#include <gtest/gtest.h>

#include <algorithm>
#include <cstring>
#include <memory>
#include <random>
#include <tuple>
#include <utility>
#include <vector>

#include "Filter/AccountExpandFilterProcess.h"
#include "Filter/AccountFilterProcess.h"
#include "Filter/FilterChain.h"
#include "Filter/FilterChainBuilder.h"
#include "Filter/FilterProcess.h"
#include "Filter/FilterProcessFactory.h"
#include "Filter/GroupFilterProcess.h"
#include "Filter/RecordTest.h"
#include "tests/Support/LogCapture.h"
#include "tests/Support/MemoryFailure.h"

namespace
{

using IdList = std::vector<QVLong32>;
using KindAndId = std::pair<int, QVLong32>;
using Records = std::vector<tag_ContactsStruct>;

// Kinds in the order in which the pipeline serves them.
constexpr int PIPELINE[] = {
    FILTER_ACCOUNT, FILTER_ACCOUNT_EXPAND, FILTER_GROUP,  FILTER_GROUP_EXPAND,      FILTER_PHONE,
    FILTER_MAIL,    FILTER_FAVOURITES,     FILTER_POSTAL, FILTER_CONTACT_ID_EXPAND, FILTER_ONLINE};

// The whole filtering told once more, as plainly as possible: contacts are looked at one list
// and one flag at a time, and the lines that the filters log are written down on the way.
class CModel
{
public:
    explicit CModel(const std::vector<KindAndId>& vFilters) : m_vFilters(vFilters) {}

    // Narrows the records; what lies behind the kept ones stays. The number of kept ones.
    size_t Filter(Records& vRecords)
    {
        size_t uCount = vRecords.size();
        for (int iKind : PIPELINE)
        {
            for (const KindAndId& filter : m_vFilters)
            {
                uCount = filter.first == iKind ? Narrow(vRecords, uCount, filter) : uCount;
            }
        }
        return uCount;
    }

    const std::vector<tag_LogLine>& Lines() const { return m_vLines; }

private:
    size_t Narrow(Records& vRecords, size_t uCount, const KindAndId& filter)
    {
        Records vKept;
        for (size_t i = 0; i < uCount; ++i)
        {
            if (Passes(vRecords[i], filter))
            {
                vKept.push_back(vRecords[i]);
            }
        }
        std::copy(vKept.begin(), vKept.end(), vRecords.begin());
        return vKept.size();
    }

    static IdList Ids(const QVLong32* plList, int iNum)
    {
        return IdList(plList, std::find(plList, plList + iNum, 0));
    }

    static bool Has(const IdList& vList, QVLong32 lID)
    {
        return std::find(vList.begin(), vList.end(), lID) != vList.end();
    }

    // Id 0 is found in a list that leaves a place free.
    static bool IsMember(const IdList& vList, QVLong32 lID, size_t uPlaces)
    {
        return Has(vList, lID) || (lID == 0 && vList.size() < uPlaces);
    }

    bool IsConfined(const IdList& vAccounts, QVLong32 lID)
    {
        if (vAccounts.size() == 1)
        {
            return vAccounts[0] == lID;
        }
        m_vLines.push_back({3, "Filter/AccountExpandFilterProcess",
                            "QV_Contacts: IsSameAccountEx ACCOUNT SUM= " +
                                std::to_string(vAccounts.size()) + "\n"});
        const bool bAll = std::all_of(
            vAccounts.begin(), vAccounts.end(),
            [&](QVLong32 lAccount)
            {
                return std::find(m_vFilters.begin(), m_vFilters.end(),
                                 KindAndId(FILTER_ACCOUNT_EXPAND, lAccount)) != m_vFilters.end();
            });
        return bAll && !vAccounts.empty();
    }

    bool IsOnline(const tag_ContactsStruct& record)
    {
        if ((record.iFlags & 0x20) == 0)
        {
            return false;
        }
        m_vLines.push_back({3, "Filter/OnlineFilterProcess",
                            "OnlineFilterProcess: find one contact is  sms online\n"});
        return true;
    }

    bool Passes(const tag_ContactsStruct& record, const KindAndId& filter)
    {
        const IdList vGroups = Ids(record.lGroupID, 100);
        const IdList vAccounts = Ids(record.lAccountID, 20);
        switch (filter.first)
        {
        case 0:
            return IsMember(vGroups, filter.second, 100);
        case 1:
            return IsMember(vAccounts, filter.second, 20);
        case 2:
            return (record.iFlags & 0x04) != 0;
        case 5:
            return (record.iFlags & 0x08) != 0;
        case 6:
            return !IsMember(vGroups, filter.second, 100);
        case 7:
            return (record.iFlags & 0x02) != 0;
        case 8:
            return (record.iFlags & 0x10) != 0;
        case 9:
            return !IsConfined(vAccounts, filter.second);
        case 10:
            return record.iContactID != filter.second;
        default:
            return IsOnline(record);
        }
    }

    const std::vector<KindAndId> m_vFilters;
    std::vector<tag_LogLine> m_vLines;
};

class CRandomInput
{
public:
    explicit CRandomInput(unsigned int uSeed) : m_engine(uSeed) {}

    int Below(int iEnd) { return static_cast<int>(m_engine() % static_cast<unsigned int>(iEnd)); }

    // Few different contacts, groups and accounts, so that filters meet them. Some lists have no
    // end or hold ids behind it, as in damaged records.
    tag_ContactsStruct Record(int iNo)
    {
        tag_ContactsStruct record = {};
        record.iContactID = Below(8);
        record.iFlags = static_cast<uint32_t>(m_engine() | m_engine());
        FillList(record.lGroupID, CONTACT_MAX_GROUPS);
        FillList(record.lAccountID, CONTACT_MAX_ACCOUNTS);
        record.iSortIndex = iNo;
        record.szReserved[5] = static_cast<wchar_t>(iNo);
        return record;
    }

    KindAndId Filter() { return {Below(14) - 1, Below(6) - 1}; }

private:
    void FillList(QVLong32* plList, int iNum)
    {
        const int iShape = Below(10);
        const int iFilled = iShape == 0 ? iNum : Below(4);
        for (int i = 0; i < iFilled; ++i)
        {
            plList[i] = Below(5) == 0 ? -1 : 1 + Below(4);
        }
        if (iShape == 1)
        {
            std::generate(plList + iFilled + 1, plList + iNum, [this] { return Below(5); });
        }
    }

    std::mt19937 m_engine;
};

class CPipelineModel : public testing::Test
{
protected:
    // Runs the pipeline; what lies behind the kept records stays. The number of kept ones.
    int Run(Records& vRecords)
    {
        tag_ContactsInfo info = {static_cast<int32_t>(vRecords.size()), vRecords.data()};
        EXPECT_EQ(m_pFirst->FilterRecord(&info, *m_pChain), 0);
        return info.RecordNum;
    }

    void MakeCase()
    {
        m_vRecords.clear();
        for (int i = 1 + m_random.Below(60); i > 0; --i)
        {
            m_vRecords.push_back(m_random.Record(i));
        }
        m_vFilters.clear();
        std::vector<int> vKinds(6);
        IdList vIDs(6);
        for (int i = 0, iNum = m_random.Below(6); i < iNum; ++i)
        {
            m_vFilters.push_back(m_random.Filter());
            std::tie(vKinds[static_cast<size_t>(i)], vIDs[static_cast<size_t>(i)]) =
                m_vFilters.back();
        }
        CFilterChain* pChain = nullptr;
        BuildFilterChain(vKinds.data(), vIDs.data(), static_cast<int>(m_vFilters.size()), &pChain);
        m_pChain.reset(pChain);
        if (m_random.Below(4) == 0)
        {
            m_pChain->SetFilter(nullptr);
        }
    }

    std::string Case() const
    {
        return "seed " + std::to_string(m_uSeed) + ", filters " +
               testing::PrintToString(m_vFilters);
    }

    const unsigned int m_uSeed = std::random_device()();
    CRandomInput m_random{m_uSeed};
    const std::unique_ptr<FilterProcess> m_pFirst{FilterProcessFactory::CreateFilterProcess()};
    Records m_vRecords;
    std::vector<KindAndId> m_vFilters;
    std::unique_ptr<CFilterChain> m_pChain;
};

constexpr int ROUNDS = 3000;

TEST_F(CPipelineModel, PipelineKeepsWhatTheModelKeepsWithAndWithoutMemory)
{
    for (int iRound = 0; iRound < ROUNDS; ++iRound)
    {
        MakeCase();
        CModel model(m_vFilters);
        Records vExpected = m_vRecords;
        const int iExpected = static_cast<int>(model.Filter(vExpected));
        for (int iGranted : {1000, 1, 0})
        {
            Records vFiltered = m_vRecords;
            const CLogCapture log;
            const CMemoryFailure failure(iGranted);
            ASSERT_EQ(Run(vFiltered), iExpected) << Case();
            ASSERT_EQ(0, std::memcmp(vFiltered.data(), vExpected.data(),
                                     vExpected.size() * sizeof(tag_ContactsStruct)))
                << Case();
            ASSERT_EQ(log.Lines(), model.Lines()) << Case();
        }
    }
}

TEST_F(CPipelineModel, RecordTestDecidesLikeThePipeline)
{
    for (int iRound = 0; iRound < ROUNDS; ++iRound)
    {
        MakeCase();
        const bool bExpected = std::none_of(m_vFilters.begin(), m_vFilters.end(),
                                            [](const KindAndId& filter) {
                                                return filter.first == FILTER_ACCOUNT_EXPAND ||
                                                       filter.first == FILTER_ONLINE;
                                            });
        ASSERT_EQ(CRecordTest::CanTest(*m_pChain), bExpected) << Case();
        const CLogCapture log; // the logging kinds are decided alike too
        const CRecordTest test(*m_pChain);
        for (const tag_ContactsStruct& record : m_vRecords)
        {
            Records vOne = {record};
            ASSERT_EQ(test.Keeps(record), Run(vOne) == 1) << Case();
        }
    }
}

TEST_F(CPipelineModel, TakesASetWithoutRecords)
{
    m_pChain = std::make_unique<CFilterChain>();
    m_pChain->SetFilter(new CMailFilter);
    for (int iNum : {0, 5, -3})
    {
        tag_ContactsInfo info = {iNum, nullptr};
        EXPECT_EQ(m_pFirst->FilterRecord(&info, *m_pChain), 0);
        EXPECT_EQ(info.RecordNum, 0) << Case();
    }
    EXPECT_EQ(m_pFirst->FilterRecord(nullptr, *m_pChain), -1);
}

// The membership operations as programs call them, on an object and with lists of their own.
TEST(Membership, ReadsAListUpToItsFirstZeroOrItsLength)
{
    QVLong32 lList[] = {3, 5, 0, 9};
    const struct
    {
        int iID;
        int iNum;
        int iMember;
        int iConfined; // to the accounts 3 and iID
    } aCases[] = {{3, 4, 1, 0}, {5, 4, 1, 1}, {9, 4, 0, 0}, {0, 4, 1, 0}, {0, 2, 0, 0},
                  {5, 1, 0, 0}, {3, 1, 1, 1}, {3, 0, 0, 0}, {0, -1, 0, 0}};
    for (const auto& expected : aCases)
    {
        SCOPED_TRACE(testing::Message() << expected.iID << " of " << expected.iNum);
        CFilterChain chain;
        chain.SetFilter(new CAccountExpandFilter(3));
        chain.SetFilter(new CAccountExpandFilter(expected.iID));
        EXPECT_EQ(GroupFilterProcess().IsSameGroup(expected.iID, lList, expected.iNum),
                  expected.iMember);
        EXPECT_EQ(AccountFilterProcess().IsSameAccount(expected.iID, lList, expected.iNum),
                  expected.iMember);
        EXPECT_EQ(
            AccountExpandFilterProcess().IsSameAccountEx(expected.iID, lList, expected.iNum, chain),
            expected.iConfined);
    }
}

} // namespace
