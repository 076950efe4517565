#include <gtest/gtest.h>

#include <algorithm>
#include <cstring>
#include <random>

#include "Filter/FilterProcessFactory.h"
#include "Filter/RecordTest.h"
#include "tests/Filter/FilterTestSupport.h"
#include "tests/Support/LogCapture.h"
#include "tests/Support/MemoryFailure.h"

namespace
{

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

    const std::vector<std::string>& Lines() const { return m_vLines; }

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
        m_vLines.push_back(
            "QV_Contacts: IsSameAccountEx ACCOUNT SUM= " + std::to_string(vAccounts.size()) + "\n");
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
        m_vLines.emplace_back("OnlineFilterProcess: find one contact is  sms online\n");
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
    std::vector<std::string> m_vLines;
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
        record.szReserved[5] = iNo;
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

bool SameBytes(const Records& vLeft, const Records& vRight)
{
    return vLeft.size() == vRight.size() &&
           std::equal(vLeft.begin(), vLeft.end(), vRight.begin(),
                      [](const tag_ContactsStruct& left, const tag_ContactsStruct& right)
                      { return std::memcmp(&left, &right, sizeof(left)) == 0; });
}

class CPipelineModel : public testing::Test
{
protected:
    void MakeCase()
    {
        m_vRecords.clear();
        for (int i = m_random.Below(60); i > 0; --i)
        {
            m_vRecords.push_back(m_random.Record(i));
        }
        m_vFilters.clear();
        for (int i = m_random.Below(6); i > 0; --i)
        {
            m_vFilters.push_back(m_random.Filter());
        }
        m_pChain = MakeChain(m_vFilters);
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
            int iCount = -1;
            ASSERT_EQ(RunPipeline(*m_pFirst, *m_pChain, vFiltered, &iCount), 0) << Case();
            ASSERT_EQ(iCount, iExpected) << Case();
            ASSERT_TRUE(SameBytes(vFiltered, vExpected)) << Case();
            ASSERT_EQ(log.Texts(3), model.Lines()) << Case();
        }
    }
}

TEST_F(CPipelineModel, RecordTestDecidesLikeThePipeline)
{
    int iTested = 0;
    for (int iRound = 0; iRound < ROUNDS; ++iRound)
    {
        MakeCase();
        const bool bExpected = std::none_of(m_vFilters.begin(), m_vFilters.end(),
                                            [](const KindAndId& filter) {
                                                return filter.first == FILTER_ACCOUNT_EXPAND ||
                                                       filter.first == FILTER_ONLINE;
                                            });
        ASSERT_EQ(CRecordTest::CanTest(*m_pChain), bExpected) << Case();
        iTested += bExpected ? 1 : 0;

        const CLogCapture log; // the logging kinds are decided alike too
        const CRecordTest test(*m_pChain);
        for (const tag_ContactsStruct& record : m_vRecords)
        {
            Records vOne = {record};
            int iCount = -1;
            RunPipeline(*m_pFirst, *m_pChain, vOne, &iCount);
            ASSERT_EQ(test.Keeps(record), iCount == 1) << Case();
        }
    }
    EXPECT_GT(iTested, ROUNDS / 4);
}

TEST(RecordTest, LeavesUnknownFiltersToThePipeline)
{
    class CUnknownFilter : public CFilter
    {
    public:
        explicit CUnknownFilter(int iType) : CFilter(iType) {}
    };
    const tag_ContactsStruct record = MakeContact(1, {}, {}, 0);
    for (int iType : {-1, 3, 4, 12, INT32_MAX})
    {
        CFilterChain chain;
        chain.SetFilter(new CUnknownFilter(iType));
        EXPECT_FALSE(CRecordTest::CanTest(chain)) << iType;
        EXPECT_TRUE(CRecordTest(chain).Keeps(record)) << iType;
    }
}

} // namespace
