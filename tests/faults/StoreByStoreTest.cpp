// A process that dies between any two stores to the store files, and a machine that loses power
// there: each state of the files is marked or right, shows nobody under another's name, and ends
// like a fresh build after the next notification.

#include "Common/DataPaths.h"
#include "Filter/FilterChain.h"
#include "LocalizerImpl/QVLocalizerManager.h"
#include "tests/Support/ChildProcess.h"
#include "tests/Support/StoreFiles.h"
#include "tests/faults/Readings.h"
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
    CFilterChain everybody;
    wchar_t szInput[1] = {};
    wchar_t szWords[CN_WORD_MAX + 1] = {};
    long lMask = 0;
    tag_LocalizerResult* pResult = nullptr;
    if (logic.Search(nullptr, szInput, IME_SEARCH_WORD, &everybody, 0, &pResult, &lMask, szWords) !=
        0)
    {
        return "no search";
    }
    std::string strFault;
    for (int i = 0; i < pResult->iResultNum; ++i)
    {
        const tag_LocalizerDetail& entry = pResult->pDetail[i];
        strFault += entry.iContactID == 0 ? "nobody found" : "";
        strFault += store.MixedContact(entry.iContactID, nullptr, entry.szLocalizerKey);
    }
    logic.FreeSearchResult(pResult);
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

// In name order a time and its count change one after the other in a store that stays whole.
STORE_KIND KindOf(const CStoreCase& store, tag_StoreImage image, std::string* pstrWhy)
{
    const STORE_KIND eKind = store.KindOf(image, pstrWhy);
    if (eKind != KIND_WRONG || std::strcmp(store.Change().szName, "Time") != 0)
    {
        return eKind;
    }
    const tag_StoreImage& after = store.After(store.SortType());
    for (size_t i = 0; i < image.vRecords.size(); ++i)
    {
        image.vRecords[i].llLastTimeContacted = after.vRecords.at(i).llLastTimeContacted;
        image.vRecords[i].iTimesContacted = after.vRecords.at(i).iTimesContacted;
    }
    return store.KindOf(image, pstrWhy);
}

// Searches and copies read records only under the lock.
TEST(Faults, ReadsRecordsUnderTheLock)
{
    const CStoreCase store(AllChanges().back(), STORE_ORDER_NAME);
    store.Restore();
    const CShared<tag_Steps> steps;
    CLocalizerLogic logic;
    for (const tag_Reading& reading : AllReadings())
    {
        tag_Answer answer;
        CStoreStepper stepper(*steps, false);
        reading.pfnRead(logic, answer);
        EXPECT_EQ(stepper.Fault(), "") << reading.szName;
        logic.FreeSearchResult(answer.pResult);
    }
}

class CStoreByStore : public testing::TestWithParam<std::tuple<tag_Change, int>>
{
};

TEST_P(CStoreByStore, IsMarkedOrRight)
{
    const auto& [change, iSortType] = GetParam();
    const std::string strCase = change.szName + std::to_string(iSortType);
    const bool bSetsSortType = std::strcmp(change.szName, "SortType") == 0;
    const CStoreCase store(change, iSortType);
    const CShared<tag_Steps> steps;
    store.Restore();
    tag_Files files = {CDataDirectory::ReadBytes(CDataPaths::ContactReg()), RecordsFile()};
    const auto Expect = [&strCase](const std::string& strFault, uint32_t uStep)
    {
        EXPECT_EQ(strFault, "") << strCase << ", store " << uStep;
        return strFault.empty();
    };
    const auto fnRun = [&]
    {
        CLocalizerLogic logic;
        CStoreStepper stepper(*steps, bSetsSortType);
        store.Change().fnTell(logic);
        return stepper.Fault();
    };
    Expect(CChild(fnRun, HANGS).Text(), 0);
    if (!CStoreStepper::IsPossible())
    {
        GTEST_SKIP() << "no single steps here: only the lock was looked at";
    }
    ASSERT_LT(steps->uSteps, tag_Steps::MAX_STEPS);
    const std::string strLastReg = CDataDirectory::ReadBytes(CDataPaths::ContactReg());
    const std::string strLastRecords = RecordsFile();
    std::set<std::string> setKinds;
    STORE_KIND eKind = KIND_NONE;
    CDisk disk(files);
    for (uint32_t i = 0; i < steps->uSteps; ++i)
    {
        files.Apply(steps->aSteps[i]);
        disk.Note(steps->aSteps[i], files);
        const auto fnLook = [&](const tag_Files& left)
        {
            std::string strLeft;
            Expect(KindOf(store, left.Image(), &strLeft) == KIND_WRONG ? "on disk: " + strLeft : "",
                   i);
        };
        Expect(disk.EachWhole(fnLook) ? "" : "on disk: changes without a mark", i);
        std::string strWhy;
        eKind = KindOf(store, files.Image(), &strWhy);
        if (!Expect(eKind == KIND_WRONG ? strWhy : "", i) || !setKinds.insert(files.Kind()).second)
        {
            continue;
        }
        CStoreCase::Write(files.strReg, files.strRecords, files.strRecords.size());
        Expect(SearchFault(store), i);
        Expect(NextFault(store, eKind, setKinds.size() % 2 == 0), i);
    }
    std::cout << strCase << ": " << steps->uSteps << " stores, " << setKinds.size() << " repairs\n";
    EXPECT_EQ(eKind, bSetsSortType ? KIND_MARKED : KIND_AFTER);
    EXPECT_TRUE(files.strReg == strLastReg && files.strRecords == strLastRecords);
}

INSTANTIATE_TEST_SUITE_P(Faults, CStoreByStore,
                         testing::Combine(testing::ValuesIn(AllChanges()), testing::Values(0, 1)),
                         [](const auto& parameters)
                         {
                             return std::string(std::get<0>(parameters.param).szName) +
                                    (std::get<1>(parameters.param) == 0 ? "ByName" : "ByTime");
                         });

} // namespace
