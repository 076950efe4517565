#include "tests/faults/StoreStepper.h"

#include "Common/DataPaths.h"
#include "tests/Support/StoreFiles.h"

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

tag_Region g_aRegions[2]; // of the records and of the registration record
tag_Steps* g_pSteps;
tag_Region g_window; // that is writable for one instruction
bool g_bWindowOfReg;
char g_acBefore[WINDOW];

bool IsLocked(const std::string& strPath)
{
    const int iFd = open(strPath.c_str(), O_RDONLY);
    const bool bLocked = flock(iFd, LOCK_EX | LOCK_NB) != 0 && errno == EWOULDBLOCK;
    close(iFd);
    return bLocked;
}

#if defined(__x86_64__) && !defined(__SANITIZE_ADDRESS__)
constexpr bool CAN_STEP = true;
constexpr greg_t TRAP_FLAG = 0x100;

void SetTrap(void* pContext, bool bOn)
{
    greg_t& flags = static_cast<ucontext_t*>(pContext)->uc_mcontext.gregs[REG_EFL];
    flags = bOn ? flags | TRAP_FLAG : flags & ~TRAP_FLAG;
}
#else
constexpr bool CAN_STEP = false;

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
    std::signal(iSignal, SIG_DFL);
}

// The instruction is done: notes what it changed.
void OnStep(int /*iSignal*/, siginfo_t* /*pInfo*/, void* pContext)
{
    SetTrap(pContext, false);
    mprotect(g_window.pAddr, g_window.uSize, PROT_READ);
    const char* pEnd = g_window.pAddr + g_window.uSize;
    const char* pFirst = std::mismatch<const char*>(g_window.pAddr, pEnd, g_acBefore).first;
    if (pFirst == pEnd)
    {
        return;
    }
    const char* pLast = pEnd;
    while (*(pLast - 1) == g_acBefore[pLast - 1 - g_window.pAddr])
    {
        --pLast;
    }
    tag_Step& step = g_pSteps->aSteps[g_pSteps->uSteps++ % tag_Steps::MAX_STEPS];
    step.eKind = STEP_STORE;
    step.bReg = g_bWindowOfReg;
    step.uBytes = static_cast<uint8_t>(pLast - pFirst);
    step.uOffset = static_cast<uint32_t>(pFirst - g_aRegions[g_bWindowOfReg ? 1 : 0].pAddr);
    std::memcpy(step.acBytes, pFirst, std::min<size_t>(step.uBytes, tag_Step::MAX_BYTES));
}

void SetHandler(int iSignal, void (*pfnHandler)(int, siginfo_t*, void*))
{
    struct sigaction action = {};
    action.sa_flags = SA_SIGINFO;
    action.sa_sigaction = pfnHandler;
    sigaction(iSignal, &action, nullptr);
}

} // namespace

bool CStoreStepper::IsPossible()
{
    return CAN_STEP;
}

CStoreStepper::CStoreStepper(tag_Steps& steps)
{
    g_pSteps = &steps;
    steps.uSteps = 0;
    if (CAN_STEP)
    {
        SetHandler(SIGSEGV, &OnRefusedStore);
        SetHandler(SIGTRAP, &OnStep);
    }
    Set(this);
}

CStoreStepper::~CStoreStepper()
{
    Set(nullptr);
    std::signal(SIGSEGV, SIG_DFL);
    std::signal(SIGTRAP, SIG_DFL);
}

void CStoreStepper::Happens(MAP_EVENT eEvent, const tag_Mapping& mapping)
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
    if (eEvent == MAP_ENDS)
    {
        region.uSize = region.pAddr == mapping.pAddr ? 0 : region.uSize;
        return;
    }
    tag_Step& step = g_pSteps->aSteps[g_pSteps->uSteps++];
    step = {eEvent == MAP_MADE ? STEP_LENGTH : STEP_FLUSH, bReg, 0, 0, {}};
    if (eEvent == MAP_MADE)
    {
        step.uOffset = static_cast<uint32_t>(
            (bReg ? CDataDirectory::ReadBytes(CDataPaths::ContactReg()) : RecordsFile()).size());
        region = {static_cast<char*>(mapping.pAddr), (mapping.uSize + PAGE - 1) / PAGE * PAGE};
        mprotect(mapping.pAddr, mapping.uSize, PROT_READ);
    }
}

void CStoreStepper::ExamineLocks(bool bFlushes)
{
    const std::string strLock = CDataPaths::LockFile();
    if (IsLocked(strLock) == bFlushes)
    {
        m_strFault = bFlushes ? "searches wait for the disk" : "no lock around records";
    }
    if (bFlushes && !IsLocked(strLock.substr(0, strLock.rfind('/'))))
    {
        m_strFault = "another writer may lift the mark";
    }
}
