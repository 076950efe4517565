// Processes that are killed while they write the store.
//
//   qv_crash [KILLS [SEED]]    20 kills, seed 1 by default
//
// A process changes the database, lets the system kill it at a random point of its work on the
// store and leaves what it leaves. Then the lock has to be free, readers have to come through,
// and the next build or notification of contacts or status has to bring the store to the state of
// a fresh build. A process that was done before it could be killed is no kill and comes again.

#include "Common/DataPaths.h"
#include "Core/LocalizerLogic.h"
#include "MemManager/MemManger.h"
#include "Platform/LogSink.h"
#include "tests/Support/DataDirectory.h"
#include "tests/Support/StoreImage.h"
#include "tests/stress/Board.h"
#include "tests/stress/Process.h"
#include "tests/stress/ProviderActions.h"
#include "tests/stress/SearchPlan.h"
#include "tests/stress/StateJournal.h"

#include <algorithm>
#include <chrono>
#include <csignal>
#include <ctime>
#include <fcntl.h>
#include <filesystem>
#include <iostream>
#include <iterator>
#include <map>
#include <memory>
#include <set>
#include <stdexcept>
#include <sys/file.h>
#include <sys/wait.h>
#include <unistd.h>

namespace
{

using Clock = std::chrono::steady_clock;

constexpr int CONTACTS = 1000;
constexpr int READER_PLANS = 10;
constexpr unsigned int READER_SECONDS = 60; // a reader that takes longer hangs
constexpr int NEVER = 0;                    // microseconds until the kill

constexpr ACTION_KIND VICTIMS[] = {ACTION_CONTACTS,  ACTION_BUILD, ACTION_TIME,
                                   ACTION_SORT_TYPE, ACTION_ALL,   ACTION_STATUS};
constexpr ACTION_KIND REPAIRS[] = {ACTION_BUILD, ACTION_CONTACTS, ACTION_ALL, ACTION_STATUS};

int64_t MicrosecondsSince(Clock::time_point start)
{
    return std::chrono::duration_cast<std::chrono::microseconds>(Clock::now() - start).count();
}

// --- The processes -----------------------------------------------------------------------------

// Lets the system kill this process after a while.
class CDeathTimer
{
public:
    explicit CDeathTimer(int iMicroseconds)
    {
        sigevent event = {};
        event.sigev_notify = SIGEV_SIGNAL;
        event.sigev_signo = SIGKILL;
        timer_create(CLOCK_MONOTONIC, &event, &m_timer);
        itimerspec time = {};
        time.it_value.tv_sec = iMicroseconds / 1'000'000;
        time.it_value.tv_nsec = iMicroseconds % 1'000'000 * 1000L;
        timer_settime(m_timer, 0, &time, nullptr); // a time of 0 starts nothing
    }
    ~CDeathTimer() { timer_delete(m_timer); }
    CDeathTimer(const CDeathTimer&) = delete;
    CDeathTimer& operator=(const CDeathTimer&) = delete;

private:
    timer_t m_timer = {};
};

int RunVictim(const std::string& strRoot, unsigned int uSeed, ACTION_KIND eKind, int iDelay)
{
    const CBoard board(strRoot);
    CProviderActions provider(uSeed);
    const tag_Action action = provider.Change(eKind);
    for (size_t i = 0; i < action.vIds.size(); ++i)
    {
        board->aiIds[i] = static_cast<int32_t>(action.vIds[i]);
    }
    board->iIds = static_cast<int32_t>(action.vIds.size());
    CLocalizerLogic logic;
    const Clock::time_point start = Clock::now();
    {
        const CDeathTimer timer(iDelay);
        CProviderActions::Notify(logic, action);
    }
    board->llMicroseconds = MicrosecondsSince(start);
    return 0;
}

// Meets what a killed writer left in every way that reads.
int RunReader(unsigned int uSeed)
{
    alarm(READER_SECONDS);
    std::mt19937 random(uSeed);
    CLocalizerLogic logic;
    for (int i = 0; i < READER_PLANS; ++i)
    {
        tag_SearchPlan plan = AnyPlan(random);
        try
        {
            RunPlan(logic, plan);
        }
        catch (const CFoundTwice&)
        {
            // Allowed here: a patch was cut between moving records up and counting them.
        }
    }
    CMemManger store;
    tag_ContactsInfo* pInfo = nullptr;
    store.GetContactsResult(&pInfo);
    const std::unique_ptr<tag_ContactsInfo> info(pInfo);
    const std::unique_ptr<tag_ContactsStruct[]> records(pInfo->pContacts);
    int iTotal = 0;
    const int iMemSize = store.GetMemSize(&iTotal);
    return pInfo->RecordNum == iTotal && iMemSize >= 0 && logic.OnGetSortType() >= 0 ? 0 : 1;
}

// --- The inspection ----------------------------------------------------------------------------

// What a killed process left.
enum REMAINS
{
    REMAINS_NOTHING, // no registration record yet
    REMAINS_MARKED,  // a store that asks for a rebuild
    REMAINS_WHOLE,   // the old store or the new one
    REMAINS_KINDS
};

void Require(bool bTrue, const std::string& strWhat)
{
    if (!bTrue)
    {
        throw std::runtime_error(strWhat);
    }
}

bool IsLockFree()
{
    const int iFd = open(CDataPaths::LockFile(), O_RDWR | O_CREAT | O_CLOEXEC, 0777);
    const bool bFree = flock(iFd, LOCK_EX | LOCK_NB) == 0;
    close(iFd);
    return bFree;
}

bool HasReg()
{
    return CDataDirectory::ReadBytes(CDataPaths::ContactReg()).size() == sizeof(tag_ContactReg);
}

// The image without some contacts, without who is online, and numbered anew.
tag_StoreImage Without(tag_StoreImage image, const std::set<int32_t>& setIds)
{
    auto& vRecords = image.vRecords;
    vRecords.erase(std::remove_if(vRecords.begin(), vRecords.end(),
                                  [&setIds](const auto& record)
                                  { return setIds.count(record.iContactID) > 0; }),
                   vRecords.end());
    image.reg.iTotalNum = static_cast<int32_t>(vRecords.size());
    for (size_t i = 0; i < vRecords.size(); ++i)
    {
        vRecords[i].iSortIndex = static_cast<int32_t>(i);
        vRecords[i].iFlags &= ~CONTACT_FLAG_ONLINE;
    }
    return image;
}

class CCrashTest
{
public:
    explicit CCrashTest(unsigned int uSeed) : m_random(uSeed), m_board(m_directory.Root())
    {
        m_directory.InstallPinyinTable();
        CProviderActions(uSeed).Fill(CONTACTS);
        Require(m_logic.MemInit(true) == 0, "the first build failed");
        for (const ACTION_KIND eKind : VICTIMS)
        {
            StartVictim(eKind, NEVER);
            m_mapTime[eKind] = m_board->llMicroseconds;
        }
        m_logic.OnContactsTableChanged();
    }

    // Lets one process of the kind die and looks after it.
    void KillOne(ACTION_KIND eKind)
    {
        const bool bFirstBuild = eKind == ACTION_BUILD && Pick(3) == 0;
        do
        {
            if (bFirstBuild)
            {
                std::filesystem::remove(CDataPaths::ContactReg());
                std::filesystem::remove(CDataPaths::ContactRecords());
            }
        } while (!StartVictim(eKind, AnyDelay(eKind)));
        Require(IsLockFree(), "the lock is still held");
        CProcess reader({"reader", m_directory.Root(), std::to_string(m_random()), "0", "0"});
        RequireSuccess("a reader", reader.Wait());
        const REMAINS eRemains = Inspect();
        ++m_mapRemains[{eKind, eRemains}];
        Repair(eRemains);
    }

    void Print() const
    {
        std::cout << "killed while         nothing yet  unfinished  whole\n";
        for (const ACTION_KIND eKind : VICTIMS)
        {
            std::cout << "  " << ActionName(eKind)
                      << std::string(22 - std::string(ActionName(eKind)).size(), ' ');
            for (int i = 0; i < REMAINS_KINDS; ++i)
            {
                const auto it = m_mapRemains.find({eKind, i});
                std::cout << (it == m_mapRemains.end() ? 0 : it->second) << "\t\t";
            }
            std::cout << '\n';
        }
        std::cout << m_iSurvivors << " processes were done before they could be killed\n";
    }

private:
    int Pick(int iNum) { return static_cast<int>(m_random() % static_cast<unsigned int>(iNum)); }

    // A point of the whole work, or as often of its second half, where the files are written.
    int AnyDelay(ACTION_KIND eKind)
    {
        const int iTime = static_cast<int>(m_mapTime[eKind]) + 1;
        return Pick(2) == 0 ? 1 + Pick(iTime) : iTime / 2 + Pick(iTime / 2 + 1) + 1;
    }

    // False when the process was done before its time.
    bool StartVictim(ACTION_KIND eKind, int iDelay)
    {
        CProcess victim({"victim", m_directory.Root(), std::to_string(m_random()),
                         std::to_string(eKind), std::to_string(iDelay)});
        const int iStatus = victim.Wait();
        if (WIFSIGNALED(iStatus) && WTERMSIG(iStatus) == SIGKILL)
        {
            return true;
        }
        RequireSuccess("a victim", iStatus);
        ++m_iSurvivors;
        return false;
    }

    std::set<int32_t> TouchedIds() const
    {
        return {m_board->aiIds, m_board->aiIds + m_board->iIds};
    }

    // A store that does not ask for a rebuild is right in all but the contacts of the change that
    // was cut, and holds each of those at most once.
    REMAINS Inspect()
    {
        if (!HasReg())
        {
            return REMAINS_NOTHING;
        }
        const tag_StoreImage image = ReadStore();
        if (IsMarked(image.reg))
        {
            RequireNoRepair();
            return REMAINS_MARKED;
        }
        const std::string strFault = FaultOf(image);
        Require(strFault.empty(), "a store that looks whole: " + strFault);
        const std::set<int32_t> setIds = TouchedIds();
        const std::string strDifference =
            DifferenceOf(Without(image, setIds),
                         Without(FreshBuild(m_directory.Root(), image.reg.iSortType), setIds));
        Require(strDifference.empty(), "a store that looks whole: " + strDifference);
        return REMAINS_WHOLE;
    }

    void RequireNoRepair()
    {
        const std::string strReg = CDataDirectory::ReadBytes(CDataPaths::ContactReg());
        Require(m_logic.MemInit(false) == 0, "MemInit(false) failed");
        m_logic.OnContactTimeChanged(1, 1'700'000'000'000);
        m_logic.OnContactStarChanged(2, 1);
        Require(CDataDirectory::ReadBytes(CDataPaths::ContactReg()) == strReg,
                "a time or a star took the mark away");
    }

    void Repair(REMAINS eRemains)
    {
        tag_Action action;
        action.eKind = REPAIRS[Pick(static_cast<int>(std::size(REPAIRS)))];
        action.vIds = {1, 2, 3};
        CProviderActions::Notify(m_logic, action);
        if (eRemains == REMAINS_WHOLE)
        {
            // The cut notification, delivered again.
            m_logic.OnContactsTableChanged();
        }
        const tag_StoreImage store = ReadStore();
        Require(!IsMarked(store.reg), "still asking for a rebuild after one");
        const std::string strDifference =
            DifferenceOf(store, FreshBuild(m_directory.Root(), store.reg.iSortType));
        Require(strDifference.empty(), std::string("after a repair by ") +
                                           ActionName(action.eKind) + ": " + strDifference);
    }

    std::mt19937 m_random;
    CDataDirectory m_directory;
    CBoard m_board;
    CLocalizerLogic m_logic;
    std::map<int, int64_t> m_mapTime; // microseconds that a kind takes
    std::map<std::pair<int, int>, int> m_mapRemains;
    int m_iSurvivors = 0;
};

int RunKills(int iKills, unsigned int uSeed)
{
    const Clock::time_point start = Clock::now();
    std::cout << iKills << " kills, seed " << uSeed << std::endl;
    CCrashTest test(uSeed);
    for (int i = 0; i < iKills; ++i)
    {
        try
        {
            test.KillOne(VICTIMS[static_cast<size_t>(i) % std::size(VICTIMS)]);
        }
        catch (const std::exception& error)
        {
            throw std::runtime_error(
                "kill " + std::to_string(i) + " during " +
                ActionName(VICTIMS[static_cast<size_t>(i) % std::size(VICTIMS)]) + ": " +
                error.what());
        }
    }
    test.Print();
    std::cout << "Done in " << MicrosecondsSince(start) / 1'000'000 << " s" << std::endl;
    return 0;
}

int RunRole(const std::vector<std::string>& vArguments)
{
    CDataPaths::SetRoot(vArguments[1].c_str());
    const auto uSeed = static_cast<unsigned int>(std::stoul(vArguments[2]));
    return vArguments[0] == "reader"
               ? RunReader(uSeed)
               : RunVictim(vArguments[1], uSeed, static_cast<ACTION_KIND>(std::stoi(vArguments[3])),
                           std::stoi(vArguments[4]));
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
        if (vArguments.size() == 5)
        {
            return RunRole(vArguments);
        }
        return RunKills(
            vArguments.empty() ? 20 : std::stoi(vArguments[0]),
            vArguments.size() < 2 ? 1U : static_cast<unsigned int>(std::stoul(vArguments[1])));
    }
    catch (const std::exception& error)
    {
        std::cerr << "qv_crash: " << error.what() << std::endl;
        return 1;
    }
}
