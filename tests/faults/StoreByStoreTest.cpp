// A process that dies between any two stores to the store files, and a machine that loses power
// there: each state of the files is marked or right, shows nobody under another's name, and ends
// like a fresh build after the next notification.

#include "tests/faults/StoreCase.h"
#include "tests/faults/StoreStepper.h"

#include <gtest/gtest.h>

namespace
{

void Apply(const tag_Step& step, std::string& strFile)
{
    if (step.eKind == STEP_LENGTH)
    {
        strFile.resize(step.uOffset);
    }
    strFile.replace(step.uOffset, step.strBytes.size(), step.strBytes);
}

// What a disk may hold of the files when the power goes: what it held at the last flush with any of
// the stores since; of the registration record, which lies in one page, any version since.
class CDisk
{
public:
    explicit CDisk(const tag_StoreFiles& files)
        : m_vRegs({files.strReg}), m_strRecords(files.strRecords)
    {
    }

    // A step after which the files are these.
    void Note(const tag_Step& step, const tag_StoreFiles& files)
    {
        if (step.eKind == STEP_LENGTH)
        {
            Apply(step, step.bReg ? m_vRegs.front() : m_strRecords);
        }
        else if (step.bReg)
        {
            m_vRegs.resize(step.eKind == STEP_FLUSH ? 0 : m_vRegs.size());
            m_vRegs.push_back(files.strReg);
        }
        else if (step.eKind == STEP_FLUSH)
        {
            m_strRecords = files.strRecords;
            m_vStores.clear();
        }
        else
        {
            m_vStores.push_back(step);
        }
    }

    // Looks at each state in which the registration record asks for no rebuild. Many stores mean
    // that records have changed under such a record.
    std::string Fault(const CStoreCase& store) const
    {
        std::string strFault;
        for (const std::string& strReg : m_vRegs)
        {
            const bool bMarked = IsMarked(tag_StoreImage({strReg, ""}).reg);
            strFault += !bMarked && m_vStores.size() > MAX_STORES ? "changes without a mark" : "";
            for (size_t i = 0; !bMarked && strFault.empty() && i >> m_vStores.size() == 0; ++i)
            {
                store.KindOf(tag_StoreImage({strReg, Records(i)}), &strFault);
            }
        }
        return strFault;
    }

private:
    static constexpr size_t MAX_STORES = 10;

    // With those stores whose bits are set.
    std::string Records(size_t uStores) const
    {
        std::string strRecords = m_strRecords;
        for (size_t i = 0; i < m_vStores.size(); ++i)
        {
            if ((uStores >> i & 1) != 0)
            {
                Apply(m_vStores[i], strRecords);
            }
        }
        return strRecords;
    }

    // As they were flushed and, behind that, each version or store since.
    std::vector<std::string> m_vRegs;
    std::string m_strRecords;
    std::vector<tag_Step> m_vStores{};
};

// What a search of everybody shows in a marked store.
std::string SearchFault(const CStoreCase& store)
{
    CLocalizerLogic logic;
    tag_Answer answer;
    AllReadings()[0].pfnRun(logic, answer);
    std::string strFault = answer.iRet == 0 ? "" : "no search";
    for (int i = 0; answer.iRet == 0 && i < answer.pResult->iResultNum; ++i)
    {
        const tag_LocalizerDetail& entry = answer.pResult->pDetail[i];
        strFault += entry.iContactID == 0 ? "nobody found" : "";
        strFault += store.MixedContact(entry.iContactID, nullptr, entry.szLocalizerKey);
    }
    logic.FreeSearchResult(answer.pResult);
    return strFault;
}

// The next notification, of somebody else or of the status. One that was cut before it began is
// delivered again.
std::string NextFault(const CStoreCase& store, STORE_KIND eKind, bool bStatus)
{
    CLocalizerLogic logic;
    if (eKind == KIND_BEFORE)
    {
        logic.OnContactsTableChanged();
    }
    else
    {
        long long llOther = 4;
        logic.OnContactsTableChanged(bStatus ? 0 : 1, &llOther);
        logic.OnStatusUpdatesTableChanged(0, nullptr);
    }
    logic.MemInit(false);
    const std::string strFault = store.RepairFault();
    const tag_StoreImage image = ReadStore();
    const bool bRebuilt = strFault.empty() && eKind != KIND_AFTER;
    return bRebuilt && BytesOf(image.vRecords) != BytesOf(store.After(image.reg.iSortType).vRecords)
               ? "other bytes than a fresh build"
               : strFault;
}

// Searches and copies read records only under the lock.
TEST(Faults, ReadsRecordsUnderTheLock)
{
    const CStoreCase store(AllChanges().back(), STORE_ORDER_NAME);
    store.Restore();
    CLocalizerLogic logic;
    for (const tag_Operation& reading : AllReadings())
    {
        tag_Answer answer;
        std::string strFault;
        StepThrough([&] { reading.pfnRun(logic, answer); }, &strFault);
        EXPECT_EQ(strFault, "") << reading;
        logic.FreeSearchResult(answer.pResult);
    }
}

using CStoreByStore = testing::TestWithParam<std::tuple<tag_Operation, int>>;

TEST_P(CStoreByStore, IsMarkedOrRight)
{
    const tag_Operation& change = std::get<0>(GetParam());
    const CStoreCase store(change, std::get<1>(GetParam()));
    store.Restore();
    tag_StoreFiles files = ReadFiles();
    CDisk disk(files);
    const auto fnRun = [&change]
    {
        CLocalizerLogic logic;
        tag_Answer answer;
        change.pfnRun(logic, answer);
    };
    std::string strFault;
    const std::vector<tag_Step> vSteps = StepThrough(fnRun, &strFault);
    EXPECT_EQ(strFault, "");
    if (!CAN_STEP)
    {
        GTEST_SKIP() << "no single steps here: only the lock was looked at";
    }
    const tag_StoreFiles last = ReadFiles();
    STORE_KIND eKind = KIND_NONE;
    for (size_t i = 0; i < vSteps.size() && !HasFailure(); ++i)
    {
        SCOPED_TRACE(i);
        Apply(vSteps[i], vSteps[i].bReg ? files.strReg : files.strRecords);
        disk.Note(vSteps[i], files);
        EXPECT_EQ(disk.Fault(store), "") << "on the disk";
        eKind = store.KindOf(tag_StoreImage(files), &strFault);
        EXPECT_EQ(strFault, "");
        // A time in name order lacks its count for a moment, which no mark tells.
        if (eKind != KIND_AFTER || i + 1 == vSteps.size())
        {
            CStoreCase::Write(files);
            EXPECT_EQ(SearchFault(store), "");
            EXPECT_EQ(NextFault(store, eKind, i % 2 == 0), "");
        }
    }
    EXPECT_EQ(eKind, store.Is("SortType") ? KIND_MARKED : KIND_AFTER);
    EXPECT_TRUE(files.strReg == last.strReg && files.strRecords == last.strRecords);
}

INSTANTIATE_TEST_SUITE_P(Faults, CStoreByStore,
                         testing::Combine(testing::ValuesIn(AllChanges()), testing::Values(0, 1)));

} // namespace
