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
constexpr size_t WIDEST_STORE = 64;
constexpr char REG_FILE[] = "ContactsReg.bin";
constexpr char RECORDS_FILE[] = "ContactsLocalizer.bin";

struct tag_Region
{
    char* pAddr = nullptr;
    size_t uSize = 0; // whole pages; 0 while nothing is mapped
    std::string strLast{};
};

std::vector<tag_Step> g_vSteps;
std::string g_strFault;
tag_Region g_aRegions[2]; // of the records and of the registration record
tag_Region* g_pWritable;  // for one instruction

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
    for (tag_Region& region : g_aRegions)
    {
        if (pStore >= region.pAddr && pStore < region.pAddr + region.uSize)
        {
            g_pWritable = &region;
            mprotect(region.pAddr, region.uSize, PROT_READ | PROT_WRITE);
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
    auto& [pAddr, uSize, strLast] = *g_pWritable;
    mprotect(pAddr, uSize, PROT_READ);
    const auto uFirst = static_cast<size_t>(
        std::mismatch(strLast.begin(), strLast.end(), pAddr).first - strLast.begin());
    size_t uEnd = std::min(uSize, uFirst + WIDEST_STORE);
    while (uEnd > uFirst && pAddr[uEnd - 1] == strLast[uEnd - 1])
    {
        --uEnd;
    }
    if (uFirst < uEnd)
    {
        const std::string strBytes(pAddr + uFirst, uEnd - uFirst);
        strLast.replace(uFirst, strBytes.size(), strBytes);
        g_vSteps.push_back({STEP_STORE, g_pWritable == &g_aRegions[1], uFirst, strBytes});
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
        region.pAddr = static_cast<char*>(mapping.pAddr);
        region.uSize = (mapping.uSize + PAGE - 1) / PAGE * PAGE;
        region.strLast.assign(region.pAddr, region.uSize);
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
