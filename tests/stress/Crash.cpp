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
#include "tests/Support/ChildProcess.h"
#include "tests/Support/DataDirectory.h"
#include "tests/Support/StoreImage.h"
#include "tests/stress/Process.h"
#include "tests/stress/ProviderActions.h"
#include "tests/stress/SearchPlan.h"
#include "tests/stress/StoreFaults.h"

#include <algorithm>
#include <chrono>
#include <filesystem>
#include <iostream>
#include <iterator>
#include <memory>
#include <set>
#include <sys/time.h>
#include <unistd.h>

namespace
{

constexpr int CONTACTS = 1000;
constexpr int READER_PLANS = 10;
constexpr unsigned int READER_SECONDS = 60; // a reader that takes longer hangs
constexpr int NEVER = 0;                    // microseconds until the kill

constexpr ACTION_KIND VICTIMS[] = {ACTION_CONTACTS,  ACTION_BUILD, ACTION_TIME,
                                   ACTION_SORT_TYPE, ACTION_ALL,   ACTION_STATUS};
constexpr ACTION_KIND REPAIRS[] = {ACTION_BUILD, ACTION_CONTACTS, ACTION_ALL, ACTION_STATUS};

// The change that a process to be killed works on.
struct tag_Victim
{
    static constexpr int MAX_IDS = 400;

    int iMicroseconds; // how long it took when it was not killed
    int iIds;
    int aiIds[MAX_IDS];
};

// --- The processes -----------------------------------------------------------------------------

// Lets the system kill this process, by a signal that nobody takes, after a while or never.
void SetDeathTimer(int iMicroseconds)
{
    const itimerval time = {{0, 0}, {iMicroseconds / 1'000'000, iMicroseconds % 1'000'000}};
    setitimer(ITIMER_REAL, &time, nullptr);
}

void RunVictim(tag_Victim& victim, unsigned int uSeed, ACTION_KIND eKind, int iDelay)
{
    const tag_Action action = CProviderActions(uSeed).Change(eKind);
    std::copy(action.vIds.begin(), action.vIds.end(), victim.aiIds);
    victim.iIds = static_cast<int>(action.vIds.size());
    CLocalizerLogic logic;
    const auto start = std::chrono::steady_clock::now();
    SetDeathTimer(iDelay);
    CProviderActions::Notify(logic, action);
    SetDeathTimer(NEVER);
    const std::chrono::duration<double, std::micro> time = std::chrono::steady_clock::now() - start;
    victim.iMicroseconds = static_cast<int>(time.count());
}

// Meets what a killed writer left. That a result holds a contact twice is allowed here: a patch
// may be cut between moving records up and counting them.
void RunReader(unsigned int uSeed)
{
    alarm(READER_SECONDS);
    std::mt19937 random(uSeed);
    CLocalizerLogic logic;
    for (int i = 0; i < READER_PLANS; ++i)
    {
        RunPlan(logic, AnyPlan(random));
    }
    CMemManger store;
    tag_ContactsInfo* pInfo = nullptr;
    store.GetContactsResult(&pInfo);
    const std::unique_ptr<tag_ContactsInfo> info(pInfo);
    const std::unique_ptr<tag_ContactsStruct[]> records(pInfo->pContacts);
    int iTotal = 0;
    Require(store.GetMemSize(&iTotal) >= 0 && pInfo->RecordNum == iTotal, "a damaged store");
    Require(logic.OnGetSortType() >= 0, "a damaged sort type");
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

// The image without some contacts, without who is online, and numbered anew.
tag_StoreImage Without(tag_StoreImage image, const std::set<int>& setIds)
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
    explicit CCrashTest(unsigned int uSeed) : m_random(uSeed)
    {
        m_directory.InstallPinyinTable();
        CProviderActions(uSeed).Fill(CONTACTS);
        Require(CLocalizerLogic().MemInit(true) == 0, "the first build failed");
        for (const ACTION_KIND eKind : VICTIMS)
        {
            StartVictim(eKind, NEVER);
            m_aiTime[eKind] = m_victim->iMicroseconds;
        }
        CLocalizerLogic().OnContactsTableChanged();
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
        CLockHolder().Kill(); // throws when the lock is still held
        const auto uSeed = static_cast<unsigned int>(m_random());
        Require(!CProcess([uSeed] { RunReader(uSeed); }).WasKilled("a reader"), "a reader died");
        const REMAINS eRemains = Inspect();
        ++m_aiRemains[eKind][eRemains];
        Repair(eRemains);
    }

    void Print() const
    {
        std::cout << "\nLeft by those that were killed:\n";
        for (const ACTION_KIND eKind : VICTIMS)
        {
            const int* piRemains = m_aiRemains[eKind];
            std::cout << ActionName(eKind) << ": " << piRemains[REMAINS_NOTHING]
                      << " times nothing yet, " << piRemains[REMAINS_MARKED] << " unfinished, "
                      << piRemains[REMAINS_WHOLE] << " whole\n";
        }
        std::cout << m_iSurvivors << " processes were done before they could be killed\n";
    }

private:
    int Pick(int iNum) { return static_cast<int>(m_random() % static_cast<unsigned int>(iNum)); }

    // A point of the whole work, or as often of its second half, where the files are written.
    int AnyDelay(ACTION_KIND eKind)
    {
        const int iTime = m_aiTime[eKind] + 1;
        return Pick(2) == 0 ? 1 + Pick(iTime) : iTime / 2 + Pick(iTime / 2 + 1) + 1;
    }

    // False when the process was done before its time.
    bool StartVictim(ACTION_KIND eKind, int iDelay)
    {
        const auto uSeed = static_cast<unsigned int>(m_random());
        const bool bKilled =
            CProcess([&] { RunVictim(*m_victim, uSeed, eKind, iDelay); }).WasKilled("a victim");
        m_iSurvivors += bKilled ? 0 : 1;
        return bKilled;
    }

    // A store that does not ask for a rebuild is right in all but the contacts of the change that
    // was cut, and holds each of those at most once.
    REMAINS Inspect()
    {
        if (CDataDirectory::ReadBytes(CDataPaths::ContactReg()).size() != sizeof(tag_ContactReg))
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
        const std::set<int> setIds(m_victim->aiIds, m_victim->aiIds + m_victim->iIds);
        const std::string strDifference =
            DifferenceOf(Without(image, setIds),
                         Without(FreshBuild(m_directory.Root(), image.reg.iSortType), setIds));
        Require(strDifference.empty(), "a store that looks whole: " + strDifference);
        return REMAINS_WHOLE;
    }

    void RequireNoRepair()
    {
        const std::string strReg = CDataDirectory::ReadBytes(CDataPaths::ContactReg());
        CLocalizerLogic logic;
        logic.OnContactTimeChanged(1, 1'700'000'000'000);
        logic.OnContactStarChanged(2, 1);
        Require(CDataDirectory::ReadBytes(CDataPaths::ContactReg()) == strReg,
                "a time or a star took the mark away");
    }

    void Repair(REMAINS eRemains)
    {
        tag_Action action;
        action.eKind = REPAIRS[Pick(static_cast<int>(std::size(REPAIRS)))];
        action.vIds = {1, 2, 3};
        CLocalizerLogic logic;
        CProviderActions::Notify(logic, action);
        if (eRemains == REMAINS_WHOLE)
        {
            // The cut notification, delivered again.
            logic.OnContactsTableChanged();
        }
        RequireFreshStore(m_directory.Root(), ActionName(action.eKind));
    }

    std::mt19937 m_random;
    CDataDirectory m_directory;
    CShared<tag_Victim> m_victim;
    int m_aiTime[ACTION_KINDS] = {}; // microseconds that a kind takes
    int m_aiRemains[ACTION_KINDS][REMAINS_KINDS] = {};
    int m_iSurvivors = 0;
};

void RunKills(int iKills, unsigned int uSeed)
{
    std::cout << iKills << " kills, seed " << uSeed << std::endl;
    CCrashTest test(uSeed);
    for (int i = 0; i < iKills; ++i)
    {
        const ACTION_KIND eKind = VICTIMS[static_cast<size_t>(i) % std::size(VICTIMS)];
        std::cout << "kill " << i << " during " << ActionName(eKind) << '\r' << std::flush;
        test.KillOne(eKind);
    }
    test.Print();
}

} // namespace

int main(int argc, char** argv)
{
    return RunProgram(argc, argv, {20, 1},
                      [](const std::vector<int>& vNumbers)
                      { RunKills(vNumbers[0], static_cast<unsigned int>(vNumbers[1])); });
}
