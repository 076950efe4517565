// A process that dies between any two stores to the store files, and a machine that loses power
// there: each state of the files is marked or right, shows nobody under another's name, and ends
// like a fresh build after the next notification.

#include "Common/DataPaths.h"
#include "tests/Support/ChildProcess.h"
#include "tests/Support/StoreFiles.h"
#include "tests/faults/StoreCase.h"
#include "tests/faults/StoreStepper.h"

#include <gtest/gtest.h>
#include <iostream>
#include <map>
#include <set>

namespace
{

constexpr unsigned int HANGS = 60; // seconds

// The two files while the steps are replayed.
struct tag_Files
{
    std::string strReg;
    std::string strRecords;

    std::string& Of(const tag_Step& step) { return step.bReg ? strReg : strRecords; }
    void Apply(const tag_Step& step)
    {
        std::string& strFile = Of(step);
        if (step.eKind == STEP_LENGTH)
        {
            strFile.resize(step.uOffset);
        }
        else if (step.eKind == STEP_STORE)
        {
            strFile.replace(step.uOffset, step.uBytes, step.acBytes, step.uBytes);
        }
    }

    tag_StoreImage Image() const
    {
        tag_StoreImage image;
        if (strReg.size() == sizeof(image.reg))
        {
            std::memcpy(&image.reg, strReg.data(), sizeof(image.reg));
        }
        const auto uCount = static_cast<size_t>(std::max(image.reg.iTotalNum, 0));
        image.vRecords.resize(std::min(uCount, strRecords.size() / sizeof(tag_ContactsStruct)));
        std::memcpy(static_cast<void*>(image.vRecords.data()), strRecords.data(),
                    image.vRecords.size() * sizeof(tag_ContactsStruct));
        return image;
    }

    // What tells states apart that have to be looked at from outside: the registration record and
    // where each contact lies.
    std::string Kind() const
    {
        std::string strKind = strReg;
        for (const tag_ContactsStruct& record : Image().vRecords)
        {
            strKind += ' ' + std::to_string(record.iContactID);
        }
        return strKind;
    }
};

// What a disk may hold of the files when the power goes: of each page what it held at the last
// flush, or anything that it was since.
class CDisk
{
public:
    explicit CDisk(const tag_Files& files) : m_flushed(files) {}

    void Note(const tag_Step& step, tag_Files& files)
    {
        if (step.eKind == STEP_FLUSH)
        {
            m_flushed.Of(step) = files.Of(step);
            m_aPages[step.bReg ? 1 : 0].clear();
        }
        else if (step.eKind == STEP_LENGTH)
        {
            m_flushed.Apply(step);
        }
        else
        {
            for (size_t i = step.uOffset / PAGE; i * PAGE < step.uOffset + step.uBytes; ++i)
            {
                m_aPages[step.bReg ? 1 : 0][i].push_back(files.Of(step).substr(i * PAGE, PAGE));
            }
        }
    }

    // Calls fnLook with each state in which the registration record asks for no rebuild; false
    // when there are too many, since records have changed under such a record.
    template <typename FnLook>
    bool EachWhole(FnLook fnLook) const
    {
        std::vector<std::string> vRegs = {m_flushed.strReg};
        for (const auto& [uPage, vVersions] : m_aPages[1])
        {
            vRegs.insert(vRegs.end(), vVersions.begin(), vVersions.end());
        }
        size_t uStates = 1;
        for (const auto& [uPage, vVersions] : m_aPages[0])
        {
            uStates = std::min(MAX_STATES, uStates * (vVersions.size() + 1));
        }
        for (const std::string& strReg : vRegs)
        {
            const tag_Files files = {strReg, m_flushed.strRecords};
            if (files.Image().reg == tag_ContactReg{} || IsMarked(files.Image().reg))
            {
                continue;
            }
            if (uStates == MAX_STATES)
            {
                return false;
            }
            for (size_t i = 0; i < uStates; ++i)
            {
                fnLook(Mixed(files, i));
            }
        }
        return true;
    }

private:
    static constexpr size_t PAGE = 4096;
    static constexpr size_t MAX_STATES = 1000;

    // The uState-th choice of what is on each page of the records.
    tag_Files Mixed(tag_Files files, size_t uState) const
    {
        for (const auto& [uPage, vVersions] : m_aPages[0])
        {
            const size_t uVersion = uState % (vVersions.size() + 1);
            uState /= vVersions.size() + 1;
            if (uVersion > 0)
            {
                files.strRecords.replace(uPage * PAGE, PAGE, vVersions[uVersion - 1]);
            }
        }
        return files;
    }

    tag_Files m_flushed;
    std::map<size_t, std::vector<std::string>> m_aPages[2]; // since then; records, then reg
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
    long long llOther = 4;
    if (eKind == KIND_BEFORE)
    {
        logic.OnContactsTableChanged();
    }
    else if (bStatus)
    {
        logic.OnStatusUpdatesTableChanged(0, nullptr);
    }
    else
    {
        logic.OnContactsTableChanged(1, &llOther);
        logic.OnStatusUpdatesTableChanged(0, nullptr);
    }
    logic.MemInit(false);
    const std::string strFault = store.RepairFault();
    const tag_StoreImage image = CStoreCase::Present();
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
    const CShared<tag_Steps> steps;
    CLocalizerLogic logic;
    for (const tag_Operation& reading : AllReadings())
    {
        tag_Answer answer;
        CStoreStepper stepper(*steps);
        reading.pfnRun(logic, answer);
        EXPECT_EQ(stepper.Fault(), "") << reading.szName;
        logic.FreeSearchResult(answer.pResult);
    }
}

class CStoreByStore : public testing::TestWithParam<std::tuple<tag_Operation, int>>
{
};

TEST_P(CStoreByStore, IsMarkedOrRight)
{
    const tag_Operation& change = std::get<0>(GetParam());
    const int iSortType = std::get<1>(GetParam());
    const CStoreCase store(change, iSortType);
    const CShared<tag_Steps> steps;
    store.Restore();
    tag_Files files = {CDataDirectory::ReadBytes(CDataPaths::ContactReg()), RecordsFile()};
    uint32_t uStep = 0;
    const auto Expect = [&](const std::string& strFault)
    {
        EXPECT_EQ(strFault, "") << change << iSortType << ", store " << uStep;
        return strFault.empty();
    };
    const auto fnRun = [&, pfnRun = change.pfnRun]
    {
        CLocalizerLogic logic;
        tag_Answer answer;
        CStoreStepper stepper(*steps);
        pfnRun(logic, answer);
        return stepper.Fault();
    };
    Expect(CChild(fnRun, HANGS).Text());
    if (!CStoreStepper::IsPossible())
    {
        GTEST_SKIP() << "no single steps here: only the lock was looked at";
    }
    ASSERT_LT(steps->uSteps, tag_Steps::MAX_STEPS);
    const tag_Files last = {CDataDirectory::ReadBytes(CDataPaths::ContactReg()), RecordsFile()};
    std::set<std::string> setKinds;
    STORE_KIND eKind = KIND_NONE;
    CDisk disk(files);
    const auto fnLook = [&](const tag_Files& left)
    {
        std::string strLeft;
        Expect(store.KindOf(left.Image(), &strLeft) == KIND_WRONG ? "on disk: " + strLeft : "");
    };
    for (; uStep < steps->uSteps; ++uStep)
    {
        files.Apply(steps->aSteps[uStep]);
        disk.Note(steps->aSteps[uStep], files);
        Expect(disk.EachWhole(fnLook) ? "" : "on disk: changes without a mark");
        std::string strWhy;
        eKind = store.KindOf(files.Image(), &strWhy);
        if (!Expect(eKind == KIND_WRONG ? strWhy : "") || !setKinds.insert(files.Kind()).second)
        {
            continue;
        }
        CStoreCase::Write(files.strReg, files.strRecords, files.strRecords.size());
        Expect(SearchFault(store));
        Expect(NextFault(store, eKind, setKinds.size() % 2 == 0));
    }
    std::cout << change << iSortType << ": " << uStep << " stores, " << setKinds.size()
              << " repairs\n";
    EXPECT_EQ(eKind, store.Is("SortType") ? KIND_MARKED : KIND_AFTER);
    EXPECT_TRUE(files.strReg == last.strReg && files.strRecords == last.strRecords);
}

INSTANTIATE_TEST_SUITE_P(Faults, CStoreByStore,
                         testing::Combine(testing::ValuesIn(AllChanges()), testing::Values(0, 1)));

} // namespace
