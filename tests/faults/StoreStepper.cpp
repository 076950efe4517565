#include "tests/faults/StoreStepper.h"

#include "tests/Support/StoreImage.h"
#include "tests/faults/CallFaults.h"

#include <algorithm>
#include <cerrno>
#include <csignal>
#include <cstring>
#include <fcntl.h>
#include <sys/file.h>
#include <sys/mman.h>
#include <ucontext.h>
#include <unistd.h>

namespace
{

constexpr size_t PAGE = 4096;
constexpr size_t WINDOW = 2 * PAGE; // a store may cross a page's end
constexpr char REG_FILE[] = "ContactsReg.bin";
constexpr char RECORDS_FILE[] = "ContactsLocalizer.bin";

struct tag_Region
{
    char* pAddr;
    size_t uSize; // whole pages; 0 while nothing is mapped
};

std::vector<tag_Step> g_vSteps;
std::string g_strFault;
tag_Region g_aRegions[2]; // of the records and of the registration record
tag_Region g_window;      // that is writable for one instruction
bool g_bWindowOfReg;
char g_acBefore[WINDOW];

// Not where there is no such file.
bool IsLocked(const std::string& strPath)
{
    const int iFd = open(strPath.c_str(), O_RDONLY);
    const bool bLocked = flock(iFd, LOCK_EX | LOCK_NB) != 0 && errno == EWOULDBLOCK;
    close(iFd);
    return bLocked;
}

#ifdef QV_CAN_STEP
constexpr greg_t TRAP_FLAG = 0x100;

void SetTrap(void* pContext, bool bOn)
{
    greg_t& flags = static_cast<ucontext_t*>(pContext)->uc_mcontext.gregs[REG_EFL];
    flags = bOn ? flags | TRAP_FLAG : flags & ~TRAP_FLAG;
}
#else
void SetTrap(void* /*pContext*/, bool /*bOn*/) {}
#endif

// A store to a read-only page: lets it through.
void OnRefusedStore(int iSignal, siginfo_t* pInfo, void* pContext)
{
    char* pStore = static_cast<char*>(pInfo->si_addr);
    for (const tag_Region& region : g_aRegions)
    {
        if (pStore >= region.pAddr && pStore < region.pAddr + region.uSize)
        {
            const auto uAt = static_cast<size_t>(pStore - region.pAddr) / PAGE * PAGE;
            g_window = {region.pAddr + uAt, std::min(WINDOW, region.uSize - uAt)};
            g_bWindowOfReg = &region == &g_aRegions[1];
            std::memcpy(g_acBefore, g_window.pAddr, g_window.uSize);
            mprotect(g_window.pAddr, g_window.uSize, PROT_READ | PROT_WRITE);
            SetTrap(pContext, true);
            return;
        }
    }
    (void)std::signal(iSignal, SIG_DFL);
}

// The instruction is done: notes what it changed. It wrote to a mapping and is in no allocation.
void OnStep(int /*iSignal*/, siginfo_t* /*pInfo*/, void* pContext)
{
    SetTrap(pContext, false);
    mprotect(g_window.pAddr, g_window.uSize, PROT_READ);
    const char* pEnd = g_window.pAddr + g_window.uSize;
    const char* pFirst = std::mismatch<const char*>(g_window.pAddr, pEnd, g_acBefore).first;
    while (pEnd > pFirst && *(pEnd - 1) == g_acBefore[pEnd - 1 - g_window.pAddr])
    {
        --pEnd;
    }
    if (pFirst < pEnd)
    {
        const char* pFile = g_aRegions[g_bWindowOfReg ? 1 : 0].pAddr;
        const auto uOffset = static_cast<size_t>(pFirst - pFile);
        g_vSteps.push_back({STEP_STORE, g_bWindowOfReg, uOffset, {pFirst, pEnd}});
    }
}

void SetHandler(int iSignal, void (*pfnHandler)(int, siginfo_t*, void*))
{
    struct sigaction action = {};
    action.sa_flags = SA_SIGINFO;
    action.sa_sigaction = pfnHandler;
    sigaction(iSignal, &action, nullptr);
}

void ExamineLocks(bool bFlushes)
{
    const std::string strLock = CDataPaths::LockFile();
    if (IsLocked(strLock) == bFlushes)
    {
        g_strFault = bFlushes ? "searches wait for the disk" : "no lock around records";
    }
    if (bFlushes && !IsLocked(strLock.substr(0, strLock.rfind('/'))))
    {
        g_strFault = "another writer may lift the mark";
    }
}

void OnMapping(MAP_EVENT eEvent, const tag_Mapping& mapping)
{
    const bool bReg = std::strcmp(mapping.szFile, REG_FILE) == 0;
    const bool bRecords = std::strcmp(mapping.szFile, RECORDS_FILE) == 0;
    if (bRecords)
    {
        ExamineLocks(eEvent == MAP_FLUSHED);
    }
    if (!CAN_STEP || !mapping.bWritten || (!bReg && !bRecords))
    {
        return;
    }
    tag_Region& region = g_aRegions[bReg ? 1 : 0];
    if (eEvent == MAP_MADE)
    {
        const tag_StoreFiles files = ReadFiles();
        g_vSteps.push_back(
            {STEP_LENGTH, bReg, (bReg ? files.strReg : files.strRecords).size(), ""});
        region = {static_cast<char*>(mapping.pAddr), (mapping.uSize + PAGE - 1) / PAGE * PAGE};
        mprotect(mapping.pAddr, mapping.uSize, PROT_READ);
    }
    else if (eEvent == MAP_FLUSHED)
    {
        g_vSteps.push_back({STEP_FLUSH, bReg, 0, ""});
    }
    else if (region.pAddr == mapping.pAddr)
    {
        region.uSize = 0;
    }
}

} // namespace

std::vector<tag_Step> StepThrough(const std::function<void()>& fnRun, std::string* pstrFault)
{
    g_vSteps.clear();
    g_strFault.clear();
    SetHandler(SIGSEGV, &OnRefusedStore);
    SetHandler(SIGTRAP, &OnStep);
    WatchMappings(&OnMapping);
    fnRun();
    WatchMappings(nullptr);
    (void)std::signal(SIGSEGV, SIG_DFL);
    (void)std::signal(SIGTRAP, SIG_DFL);
    *pstrFault = g_strFault;
    return g_vSteps;
}
