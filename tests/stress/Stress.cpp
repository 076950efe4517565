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
#include "Platform/LogSink.h"
#include "tests/Support/DataDirectory.h"
#include "tests/Support/StoreImage.h"
#include "tests/stress/Board.h"
#include "tests/stress/Process.h"
#include "tests/stress/ProviderActions.h"
#include "tests/stress/SearchPlan.h"
#include "tests/stress/StateJournal.h"

#include <chrono>
#include <cstring>
#include <fstream>
#include <iostream>
#include <map>
#include <memory>
#include <stdexcept>

namespace
{

constexpr int SEARCHERS = 4;
constexpr int CONTACTS = 250;
constexpr unsigned int MAX_SEARCH_PAUSE = 20'000; // microseconds, as all below
constexpr unsigned int MAX_HOLD = 8'000;
constexpr unsigned int LONG_HOLD = 1'200'000; // refuses a search for good
constexpr unsigned int MAX_HOLD_PAUSE = 30'000;
constexpr unsigned int LONG_HOLD_ONE_IN = 120;
constexpr unsigned int POLL = 500;

// One plan as a searcher ran it.
struct tag_Observation
{
    uint32_t uPlanSeed;
    int32_t iFirstState; // the store had one of the states iFirstState to iLastState
    int32_t iLastState;
    int32_t bRefused;
    tag_SearchOutcome outcome;
};

unsigned int Below(std::mt19937& random, unsigned int uLimit)
{
    return static_cast<unsigned int>(random() % uLimit);
}

std::string ObservationFile(const std::string& strRoot, int iSearcher)
{
    return strRoot + "/observed." + std::to_string(iSearcher);
}

// Tells whether the library gave up taking the lock.
class CRefusalWatch
{
public:
    CRefusalWatch() { CLogSink::Set(&CRefusalWatch::Receive, this); }
    ~CRefusalWatch() { CLogSink::Set(nullptr, nullptr); }
    CRefusalWatch(const CRefusalWatch&) = delete;
    CRefusalWatch& operator=(const CRefusalWatch&) = delete;

    bool Take()
    {
        const bool bRefused = m_bRefused;
        m_bRefused = false;
        return bRefused;
    }

private:
    static void Receive(void* pContext, int /*iPriority*/, const char* /*szTag*/,
                        const char* szText)
    {
        if (std::strcmp(szText,
                        "QV_Contacts:CopyContactsResult write share memo lock false return") == 0)
        {
            static_cast<CRefusalWatch*>(pContext)->m_bRefused = true;
        }
    }

    bool m_bRefused = false;
};

// --- The processes -----------------------------------------------------------------------------

void WaitFor(const std::atomic<int32_t>& iFlag)
{
    while (iFlag == 0)
    {
        SleepMicroseconds(POLL);
    }
}

int RunProvider(const std::string& strRoot, unsigned int uSeed, int iChanges)
{
    const CBoard board(strRoot);
    const CStateJournal journal(strRoot);
    CProviderActions provider(uSeed);
    provider.Fill(CONTACTS);
    CLocalizerLogic logic;
    tag_Action build;
    build.eKind = ACTION_BUILD;
    CProviderActions::Notify(logic, build);
    journal.Write(0, ReadStore());
    board->iReady = 1;
    WaitFor(board->iGo);
    std::ofstream kinds(strRoot + "/kinds");
    for (int i = 1; i <= iChanges; ++i)
    {
        const ACTION_KIND eKind = provider.AnyKind();
        const tag_Action action = provider.Change(eKind);
        board->iBegun = i;
        CProviderActions::Notify(logic, action);
        journal.Write(i, ReadStore());
        board->iDone = i;
        kinds << eKind << '\n';
    }
    return 0;
}

int RunSearcher(const std::string& strRoot, unsigned int uSeed, int iSearcher)
{
    const CBoard board(strRoot);
    CRefusalWatch refusals;
    CLocalizerLogic logic;
    std::mt19937 random(uSeed);
    std::ofstream file(ObservationFile(strRoot, iSearcher), std::ios::binary);
    while (board->iStop == 0)
    {
        tag_Observation observed = {};
        observed.uPlanSeed = static_cast<uint32_t>(random());
        std::mt19937 planRandom(observed.uPlanSeed);
        const tag_SearchPlan plan = AnyPlan(planRandom);
        observed.iFirstState = board->iDone;
        observed.outcome = RunPlan(logic, plan);
        observed.iLastState = board->iBegun;
        observed.bRefused = refusals.Take() ? 1 : 0;
        file.write(reinterpret_cast<const char*>(&observed), sizeof(observed));
        SleepMicroseconds(Below(random, MAX_SEARCH_PAUSE + 1));
    }
    return 0;
}

int RunLockHolder(const std::string& strRoot, unsigned int uSeed)
{
    const CBoard board(strRoot);
    std::mt19937 random(uSeed);
    while (board->iStop == 0)
    {
        int iFd = 0;
        if (CSingleMutex::Lock(&iFd) == 1)
        {
            const bool bLong = Below(random, LONG_HOLD_ONE_IN) == 0;
            SleepMicroseconds(bLong ? LONG_HOLD : Below(random, MAX_HOLD));
            CSingleMutex::UnLock(&iFd);
            ++board->iHolds;
        }
        SleepMicroseconds(Below(random, MAX_HOLD_PAUSE));
    }
    return 0;
}

// --- A round -----------------------------------------------------------------------------------

struct tag_Totals
{
    std::map<int, int> mapKinds{};
    int iSearches = 0;
    int iRefused = 0;
    int iNonEmpty = 0;
    int iMarked = 0; // states that asked for a rebuild
    int iHolds = 0;
};

class CRound
{
public:
    CRound(unsigned int uSeed, int iChanges) : m_uSeed(uSeed), m_iChanges(iChanges)
    {
        m_directory.InstallPinyinTable();
    }

    void Run(tag_Totals& totals)
    {
        RunProcesses(totals);
        CompareWithFreshBuild();
        ReadObservations(totals);
        CheckStates(totals);
        CheckObservations();
    }

private:
    std::unique_ptr<CProcess> Start(const char* szRole, unsigned int uNumber)
    {
        return std::make_unique<CProcess>(std::vector<std::string>{
            szRole, m_directory.Root(), std::to_string(m_uSeed * 100 + uNumber),
            std::to_string(szRole == std::string("provider") ? m_iChanges
                                                             : static_cast<int>(uNumber))});
    }

    void RunProcesses(tag_Totals& totals)
    {
        const CBoard board(m_directory.Root());
        const auto pProvider = Start("provider", 99);
        while (board->iReady == 0 && !pProvider->HasEnded())
        {
            SleepMicroseconds(POLL);
        }
        std::vector<std::unique_ptr<CProcess>> vOthers;
        for (unsigned int i = 0; i < SEARCHERS; ++i)
        {
            vOthers.push_back(Start("searcher", i));
        }
        vOthers.push_back(Start("holder", SEARCHERS));
        board->iGo = 1;
        RequireSuccess("the provider", pProvider->Wait());
        board->iStop = 1;
        for (const auto& pProcess : vOthers)
        {
            RequireSuccess("a searcher or the lock holder", pProcess->Wait());
        }
        totals.iHolds += board->iHolds;
        std::ifstream kinds(m_directory.Root() + "/kinds");
        for (int iKind = 0; kinds >> iKind;)
        {
            ++totals.mapKinds[iKind];
        }
    }

    void CompareWithFreshBuild()
    {
        CLocalizerLogic().OnStatusUpdatesTableChanged(0, nullptr);
        const tag_StoreImage store = ReadStore();
        const std::string strDifference =
            DifferenceOf(store, FreshBuild(m_directory.Root(), store.reg.iSortType));
        if (!strDifference.empty() || IsMarked(store.reg))
        {
            throw std::runtime_error("the store is not what a fresh build makes: " + strDifference);
        }
    }

    void ReadObservations(tag_Totals& totals)
    {
        for (int i = 0; i < SEARCHERS; ++i)
        {
            std::ifstream file(ObservationFile(m_directory.Root(), i), std::ios::binary);
            tag_Observation observed = {};
            while (file.read(reinterpret_cast<char*>(&observed), sizeof(observed)))
            {
                ++totals.iSearches;
                totals.iRefused += observed.bRefused;
                totals.iNonEmpty += observed.outcome.iFound > 0 ? 1 : 0;
                if (observed.bRefused == 0)
                {
                    m_vOpen.push_back(observed);
                }
                else if (observed.outcome.iFound != 0)
                {
                    throw std::runtime_error("contacts found without the lock");
                }
            }
        }
    }

    void CheckStates(tag_Totals& totals)
    {
        const CStateJournal journal(m_directory.Root());
        for (int i = 0; i <= m_iChanges; ++i)
        {
            const tag_StoreImage image = journal.Read(i);
            const std::string strFault = FaultOf(image);
            if (!strFault.empty())
            {
                throw std::runtime_error("state " + std::to_string(i) + ": " + strFault);
            }
            totals.iMarked += IsMarked(image.reg) ? 1 : 0;
        }
    }

    // Repeats every search in the states that it may have seen, until none is left open.
    void CheckObservations()
    {
        const CStateJournal journal(m_directory.Root());
        const CDataDirectory replay;
        replay.InstallPinyinTable();
        CLocalizerLogic logic;
        CQVLocalizerManager::InitMapFile();
        for (int i = 0; i <= m_iChanges; ++i)
        {
            const tag_StoreImage image = journal.Read(i);
            // The index characters may be of either sort type while one is being set.
            for (const int iSortType : {STORE_ORDER_NAME, STORE_ORDER_TIME})
            {
                InstallStore(image, iSortType);
                CloseObservations(logic, i);
            }
        }
        CDataPaths::SetRoot(m_directory.Root().c_str());
        if (!m_vOpen.empty())
        {
            const tag_Observation& observed = m_vOpen.front();
            throw std::runtime_error(std::to_string(m_vOpen.size()) +
                                     " results are of no state of the store; plan " +
                                     std::to_string(observed.uPlanSeed) + " in states " +
                                     std::to_string(observed.iFirstState) + " to " +
                                     std::to_string(observed.iLastState));
        }
    }

    void CloseObservations(CLocalizerLogic& logic, int iState)
    {
        std::vector<tag_Observation> vOpen;
        for (const tag_Observation& observed : m_vOpen)
        {
            if (!IsOfState(logic, observed, iState))
            {
                vOpen.push_back(observed);
            }
        }
        m_vOpen.swap(vOpen);
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

    unsigned int m_uSeed;
    int m_iChanges;
    CDataDirectory m_directory;
    std::vector<tag_Observation> m_vOpen; // not known yet to be right
};

void Print(const tag_Totals& totals)
{
    std::cout << "Changes:";
    for (const auto& [iKind, iCount] : totals.mapKinds)
    {
        std::cout << ' ' << iCount << ' ' << ActionName(static_cast<ACTION_KIND>(iKind)) << ',';
    }
    std::cout << " with " << totals.iMarked << " states that asked for a rebuild\n"
              << "Searches: " << totals.iSearches << " typed through and checked, "
              << totals.iNonEmpty << " with contacts found, " << totals.iRefused
              << " refused the lock\n"
              << "The lock was held " << totals.iHolds << " times\n";
}

int RunRounds(int iRounds, unsigned int uSeed, int iChanges)
{
    const auto start = std::chrono::steady_clock::now();
    tag_Totals totals;
    for (int i = 0; i < iRounds; ++i)
    {
        const unsigned int uRoundSeed = uSeed + static_cast<unsigned int>(i);
        std::cout << "Round " << i + 1 << " of " << iRounds << ", seed " << uRoundSeed << ", "
                  << iChanges << " changes" << std::endl;
        CRound(uRoundSeed, iChanges).Run(totals);
    }
    Print(totals);
    std::cout << "Done in "
              << std::chrono::duration_cast<std::chrono::seconds>(std::chrono::steady_clock::now() -
                                                                  start)
                     .count()
              << " s" << std::endl;
    return 0;
}

int RunRole(const std::vector<std::string>& vArguments)
{
    const std::string& strRoot = vArguments[1];
    const auto uSeed = static_cast<unsigned int>(std::stoul(vArguments[2]));
    CDataPaths::SetRoot(strRoot.c_str());
    if (vArguments[0] == "provider")
    {
        return RunProvider(strRoot, uSeed, std::stoi(vArguments[3]));
    }
    return vArguments[0] == "searcher" ? RunSearcher(strRoot, uSeed, std::stoi(vArguments[3]))
                                       : RunLockHolder(strRoot, uSeed);
}

void Silence(void* /*pContext*/, int /*iPriority*/, const char* /*szTag*/, const char* /*szText*/)
{
}

} // namespace

int main(int argc, char** argv)
{
    const std::vector<std::string> vArguments(argv + 1, argv + argc);
    CLogSink::Set(&Silence, nullptr);
    try
    {
        if (vArguments.size() == 4)
        {
            return RunRole(vArguments);
        }
        const auto Number = [&vArguments](size_t uPlace, int iDefault)
        { return vArguments.size() > uPlace ? std::stoi(vArguments[uPlace]) : iDefault; };
        return RunRounds(Number(0, 2), static_cast<unsigned int>(Number(1, 1)), Number(2, 25));
    }
    catch (const std::exception& error)
    {
        std::cerr << "qv_stress: " << error.what() << std::endl;
        return 1;
    }
}
