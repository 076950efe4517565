// Many processes on one store: a provider that changes its database and tells the library, some
// that search meanwhile, one that takes the store lock away from all of them.
//
//   qv_stress [ROUNDS [SEED [CHANGES]]]    2 rounds of 25 changes, seed 1 by default
//
// Each round ends with the store compared to a fresh build and every search result compared to
// what the same search gives in the states that the store had while it ran.

#include "Common/DataPaths.h"
#include "Core/LocalizerLogic.h"
#include "LocalizerImpl/QVLocalizerManager.h"
#include "MemManager/SingleMutex.h"
#include "tests/Support/ChildProcess.h"
#include "tests/Support/DataDirectory.h"
#include "tests/Support/LogCapture.h"
#include "tests/Support/StoreFiles.h"
#include "tests/Support/StoreImage.h"
#include "tests/stress/Process.h"
#include "tests/stress/ProviderActions.h"
#include "tests/stress/SearchPlan.h"
#include "tests/stress/StoreFaults.h"

#include <algorithm>
#include <atomic>
#include <fstream>
#include <iostream>
#include <memory>

namespace
{

constexpr unsigned int SEARCHERS = 4;
constexpr int CONTACTS = 250;
constexpr unsigned int MAX_SEARCH_PAUSE = 20'000; // microseconds, as all below
constexpr unsigned int MAX_HOLD = 8'000;
constexpr unsigned int LONG_HOLD = 1'200'000; // refuses a search for good
constexpr unsigned int MAX_HOLD_PAUSE = 30'000;
constexpr unsigned int LONG_HOLD_ONE_IN = 120;

// What the library logs when it gives up taking the lock.
constexpr const char* REFUSED = "QV_Contacts:CopyContactsResult write share memo lock false return";

// What the processes tell each other. The provider's change number iBegun is under
// way or done, number iDone is done and the store's state after it is written down.
struct tag_Board
{
    std::atomic<int> iBegun;
    std::atomic<int> iDone;
    std::atomic<int> iStop;

    // What all rounds did.
    std::atomic<int> iHolds; // how often the lock was held to annoy the others
    int aiKinds[ACTION_KINDS];
    int iSearches;
    int iRefused;
    int iNonEmpty;
    int iMarked; // states that asked for a rebuild
};

// One plan as a searcher ran it.
struct tag_Observation
{
    uint32_t uPlanSeed;
    int32_t iFirstState; // the store had one of the states iFirstState to iLastState
    int32_t iLastState;
    int32_t bRefused;
    tag_SearchOutcome outcome;
};

// --- The processes -----------------------------------------------------------------------------

void RunSearcher(const tag_Board& board, const std::string& strFile, unsigned int uSeed)
{
    CLogCapture log;
    CLocalizerLogic logic;
    std::mt19937 random(uSeed);
    std::ofstream file(strFile, std::ios::binary);
    while (board.iStop == 0)
    {
        log.Clear();
        tag_Observation observed = {};
        observed.uPlanSeed = static_cast<uint32_t>(random());
        std::mt19937 planRandom(observed.uPlanSeed);
        const tag_SearchPlan plan = AnyPlan(planRandom);
        observed.iFirstState = board.iDone;
        observed.outcome = RunPlan(logic, plan);
        observed.iLastState = board.iBegun;
        observed.bRefused = log.Count(ERROR_LINE, REFUSED);
        file.write(reinterpret_cast<const char*>(&observed), sizeof(observed));
        SleepMicroseconds(random() % MAX_SEARCH_PAUSE);
    }
}

void RunLockHolder(tag_Board& board, unsigned int uSeed)
{
    std::mt19937 random(uSeed);
    while (board.iStop == 0)
    {
        int iFd = 0;
        if (CSingleMutex::Lock(&iFd) == 1)
        {
            const bool bLong = random() % LONG_HOLD_ONE_IN == 0;
            SleepMicroseconds(bLong ? LONG_HOLD : random() % MAX_HOLD);
            CSingleMutex::UnLock(&iFd);
            ++board.iHolds;
        }
        SleepMicroseconds(random() % MAX_HOLD_PAUSE);
    }
}

// --- A round -----------------------------------------------------------------------------------

// Makes the image the store of the library's present root. The sort type is given apart.
void InstallStore(const tag_StoreImage& image, int iSortType)
{
    CDataDirectory::WriteBytes(CDataPaths::ContactRecords(), BytesOf(image.vRecords));
    SetReg({image.reg.iTotalNum, iSortType, 0});
}

class CRound
{
public:
    CRound(tag_Board& board, unsigned int uSeed, int iChanges)
        : m_board(board), m_uSeed(uSeed), m_iChanges(iChanges)
    {
        m_board.iBegun = m_board.iDone = m_board.iStop = 0;
        m_directory.InstallPinyinTable();
        CProviderActions(uSeed).Fill(CONTACTS);
        Require(CLocalizerLogic().MemInit(true) == 0, "the first build failed");
        m_vStates.push_back(ReadStore());
    }

    void Run()
    {
        RunProcesses();
        CLocalizerLogic().OnStatusUpdatesTableChanged(0, nullptr);
        RequireFreshStore(m_directory.Root(), "after the round");
        ReadObservations();
        CheckStates();
        CheckObservations();
    }

private:
    void RunProcesses()
    {
        std::vector<std::unique_ptr<CProcess>> vOthers;
        for (unsigned int i = 0; i < SEARCHERS; ++i)
        {
            const auto fnRun = [&] { RunSearcher(m_board, ObservationFile(i), m_uSeed * 100 + i); };
            vOthers.push_back(std::make_unique<CProcess>(fnRun));
        }
        vOthers.push_back(std::make_unique<CProcess>([&] { RunLockHolder(m_board, m_uSeed); }));
        RunProvider();
        m_board.iStop = 1;
        for (const auto& pProcess : vOthers)
        {
            Require(!pProcess->WasKilled("a searcher or the lock holder"), "a process was killed");
        }
    }

    // In this process, which writes down each state of the store.
    void RunProvider()
    {
        CProviderActions provider(m_uSeed);
        CLocalizerLogic logic;
        for (int i = 1; i <= m_iChanges; ++i)
        {
            const ACTION_KIND eKind = provider.AnyKind();
            const tag_Action action = provider.Change(eKind);
            m_board.iBegun = i;
            CProviderActions::Notify(logic, action);
            m_vStates.push_back(ReadStore());
            m_board.iDone = i;
            ++m_board.aiKinds[eKind];
        }
    }

    std::string ObservationFile(unsigned int uSearcher) const
    {
        return m_directory.Root() + "/observed." + std::to_string(uSearcher);
    }

    void ReadObservations()
    {
        for (unsigned int i = 0; i < SEARCHERS; ++i)
        {
            std::ifstream file(ObservationFile(i), std::ios::binary);
            tag_Observation observed = {};
            while (file.read(reinterpret_cast<char*>(&observed), sizeof(observed)))
            {
                ++m_board.iSearches;
                m_board.iRefused += observed.bRefused;
                m_board.iNonEmpty += observed.outcome.iFound > 0 ? 1 : 0;
                Require(observed.outcome.iTwice == 0, "a contact found twice");
                if (observed.bRefused == 0)
                {
                    m_vOpen.push_back(observed);
                }
                else
                {
                    Require(observed.outcome.iFound == 0, "contacts found without the lock");
                }
            }
        }
    }

    void CheckStates()
    {
        for (const tag_StoreImage& image : m_vStates)
        {
            const std::string strFault = FaultOf(image);
            Require(strFault.empty(), "a state: " + strFault);
            m_board.iMarked += IsMarked(image.reg) ? 1 : 0;
        }
    }

    // Repeats every search in the states that it may have seen, until none is left open.
    void CheckObservations()
    {
        const CDataDirectory replay;
        replay.InstallPinyinTable();
        CLocalizerLogic logic;
        CQVLocalizerManager::InitMapFile();
        for (int i = 0; i <= m_iChanges; ++i)
        {
            // The index characters may be of either sort type while one is being set.
            for (const int iSortType : {STORE_ORDER_NAME, STORE_ORDER_TIME})
            {
                InstallStore(m_vStates[static_cast<size_t>(i)], iSortType);
                m_vOpen.erase(std::remove_if(m_vOpen.begin(), m_vOpen.end(),
                                             [&](const tag_Observation& observed)
                                             { return IsOfState(logic, observed, i); }),
                              m_vOpen.end());
            }
        }
        CDataPaths::SetRoot(m_directory.Root().c_str());
        const tag_Observation observed = m_vOpen.empty() ? tag_Observation{} : m_vOpen.front();
        Require(m_vOpen.empty(), std::to_string(m_vOpen.size()) +
                                     " results are of no state of the store; plan " +
                                     std::to_string(observed.uPlanSeed) + " in states " +
                                     std::to_string(observed.iFirstState) + " to " +
                                     std::to_string(observed.iLastState));
    }

    static bool IsOfState(CLocalizerLogic& logic, const tag_Observation& observed, int iState)
    {
        if (iState < observed.iFirstState || iState > observed.iLastState)
        {
            return false;
        }
        std::mt19937 random(observed.uPlanSeed);
        const tag_SearchOutcome outcome = RunPlan(logic, AnyPlan(random));
        return outcome.uHash == observed.outcome.uHash && outcome.uIndex == observed.outcome.uIndex;
    }

    tag_Board& m_board;
    unsigned int m_uSeed;
    int m_iChanges;
    CDataDirectory m_directory;
    std::vector<tag_StoreImage> m_vStates{}; // before the first change and after each
    std::vector<tag_Observation> m_vOpen;    // not known yet to be right
};

void Print(const tag_Board& totals)
{
    std::cout << "Changes:";
    for (int i = 0; i < ACTION_KINDS; ++i)
    {
        std::cout << ' ' << totals.aiKinds[i] << ' ' << ActionName(static_cast<ACTION_KIND>(i))
                  << ',';
    }
    std::cout << " with " << totals.iMarked << " states that asked for a rebuild\n"
              << "Searches: " << totals.iSearches << " typed through and checked, "
              << totals.iNonEmpty << " with contacts found, " << totals.iRefused
              << " refused the lock\n"
              << "The lock was held " << totals.iHolds << " times\n";
}

void RunRounds(int iRounds, unsigned int uSeed, int iChanges)
{
    const CShared<tag_Board> board;
    for (int i = 0; i < iRounds; ++i)
    {
        const unsigned int uRoundSeed = uSeed + static_cast<unsigned int>(i);
        std::cout << "Round " << i + 1 << " of " << iRounds << ", seed " << uRoundSeed << ", "
                  << iChanges << " changes" << std::endl;
        CRound(*board, uRoundSeed, iChanges).Run();
    }
    Print(*board);
}

} // namespace

int main(int argc, char** argv)
{
    return RunProgram(
        argc, argv, {2, 1, 25},
        [](const std::vector<int>& vNumbers)
        { RunRounds(vNumbers[0], static_cast<unsigned int>(vNumbers[1]), vNumbers[2]); });
}
