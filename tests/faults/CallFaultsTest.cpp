// Every call of the C library and every allocation fails once, under every operation of the
// facade: the operation reports it or gets by, gives back what it took, and leaves a store that is
// right or that the next notification makes right.

#include "tests/faults/CallFaults.h"
#include "Common/DataPaths.h"
#include "tests/Support/ChildProcess.h"
#include "tests/Support/StoreFiles.h"
#include "tests/faults/Readings.h"
#include "tests/faults/StoreCase.h"

#include <cerrno>
#include <climits>
#include <fcntl.h>
#include <gtest/gtest.h>
#include <sys/file.h>
#include <unistd.h>

namespace
{

constexpr unsigned int HANGS = 4; // seconds; what takes one or two

struct tag_Failures
{
    const char* szName;
    CALL_GROUP eGroup;
    int iError;
    bool bOnce;
};
constexpr tag_Failures FAILURES[] = {
    {"NoDescriptor", CALLS_FILES, EMFILE, true}, {"InputOutput", CALLS_FILES, EIO, true},
    {"DiskFull", CALLS_ROOM, ENOSPC, false},     {"Refused", CALLS_LOCK, EWOULDBLOCK, true},
    {"NoMemory", CALLS_MEMORY, ENOMEM, true},    {"NoMoreMemory", CALLS_MEMORY, ENOMEM, false},
};

// Runs one operation, of whose calls so many succeed, and tells the call that failed and, behind
// ": ", what is wrong then; "" when all calls succeeded.
using FnRun = std::function<std::string(const tag_Failures& failures, int iGranted)>;

// The files behind the first descriptors, one a line.
std::string OpenDescriptors()
{
    std::string strFiles;
    for (int iFd = 0; iFd < 32; ++iFd)
    {
        char szFile[PATH_MAX] = {};
        const std::string strLink = "/proc/self/fd/" + std::to_string(iFd);
        const ssize_t iLength = readlink(strLink.c_str(), szFile, sizeof(szFile) - 1);
        strFiles += iLength > 0 ? strLink + szFile + "\n" : "";
    }
    return strFiles;
}

bool IsLockFree()
{
    const int iFd = open(CDataPaths::LockFile(), O_RDWR | O_CREAT, 0777);
    const bool bFree = flock(iFd, LOCK_EX | LOCK_NB) == 0;
    close(iFd);
    return bFree;
}

// --- Changes -----------------------------------------------------------------------------------

// What is wrong with the store right after a change that met the failure.
std::string FaultAfterChange(const CStoreCase& store, int iRet, STORE_KIND* peKind)
{
    std::string strWhy;
    *peKind = store.KindOf(CStoreCase::Present(), &strWhy);
    if (*peKind == KIND_WRONG)
    {
        return strWhy;
    }
    if (!IsResult(iRet))
    {
        return "result " + std::to_string(iRet);
    }
    const bool bReports = std::strstr(store.Change().szName, "Build") != nullptr;
    return bReports && iRet == 0 && *peKind != KIND_AFTER ? "success without a store" : "";
}

// After a refused change the same object is told of something else.
std::string FaultAfterNext(const CStoreCase& store, CLocalizerLogic& logic, int iRet,
                           STORE_KIND eKind)
{
    logic.OnStatusUpdatesTableChanged(0, nullptr);
    const bool bTold = iRet != 0 && eKind != KIND_MARKED; // the caller knows and tries again
    std::string strFault = bTold ? "" : store.RepairFault();
    if (!strFault.empty())
    {
        return "after the next notification: " + strFault;
    }
    CLocalizerLogic next;
    if (next.MemInit(false) != 0)
    {
        return "the next process cannot start";
    }
    if (eKind == KIND_NONE)
    {
        strFault = store.RepairFault();
        return strFault.empty() ? "" : "the next process finds: " + strFault;
    }
    return "";
}

std::string RunChange(const CStoreCase& store, const tag_Failures& failures, int iGranted)
{
    const std::string strFiles = OpenDescriptors();
    std::string strFault;
    std::string strCall;
    {
        CLocalizerLogic logic;
        int iRet = 0;
        {
            const CCallFault fault(failures.eGroup, iGranted, failures.iError, failures.bOnce);
            iRet = store.Change().fnTell(logic);
        }
        strCall = CCallFault::Failed();
        if (strCall.empty())
        {
            return "";
        }
        STORE_KIND eKind = KIND_WRONG;
        strFault = IsLockFree() ? FaultAfterChange(store, iRet, &eKind) : "the lock is held";
        if (strFault.empty())
        {
            strFault = FaultAfterNext(store, logic, iRet, eKind);
        }
    }
    if (strFault.empty() && OpenDescriptors() != strFiles)
    {
        strFault = "a descriptor is left open";
    }
    return strCall + ": " + strFault;
}

// Lets one call after another fail, from *piCall on, until something is wrong or all have failed.
std::string RunUntilFinding(const FnRun& fnRun, const tag_Failures& failures, int* piCall)
{
    for (;; ++*piCall)
    {
        alarm(HANGS);
        const std::string strTold = fnRun(failures, *piCall);
        if (strTold.empty() || strTold.back() != ' ')
        {
            return strTold;
        }
    }
}

void RunAll(const std::string& strCase, const FnRun& fnRun)
{
    const CShared<int> call;
    for (const tag_Failures& failures : FAILURES)
    {
        std::string strFinding = "none yet";
        for (*call = 0; !strFinding.empty(); ++*call)
        {
            const auto fnBody = [&] { return RunUntilFinding(fnRun, failures, &*call); };
            strFinding = CChild(fnBody, HANGS).Text();
            EXPECT_EQ(strFinding, "") << strCase << "/" << failures.szName << ", call " << *call;
        }
    }
}

// --- Calls that only read ----------------------------------------------------------------------

// The answer under a failure; a failing search has no result set.
std::string Read(const tag_Reading& reading, const tag_Failures& failures, int iGranted)
{
    tag_Answer answer;
    CLocalizerLogic logic;
    {
        const CCallFault fault(failures.eGroup, iGranted, failures.iError, failures.bOnce);
        reading.pfnRead(logic, answer);
    }
    const bool bSet = answer.iRet != 0 && answer.pResult != nullptr;
    return bSet ? "a set beside a failure" : TextOf(logic, answer);
}

std::string RunReading(const tag_Reading& reading, const std::string& strExpected,
                       const tag_Failures& failures, int iGranted)
{
    const std::string strFiles = OpenDescriptors();
    const std::string strReg = CDataDirectory::ReadBytes(CDataPaths::ContactReg());
    const std::string strAnswer = Read(reading, failures, iGranted);
    const std::string strCall = CCallFault::Failed();
    if (strCall.empty())
    {
        return "";
    }
    // A store that cannot be read has nobody in it.
    const bool bRight = strAnswer == strExpected || strAnswer == "-1" || strAnswer == "-1000" ||
                        (strAnswer == "0 nobody" && strExpected.find("keys") != std::string::npos);
    std::string strFault = bRight ? "" : "answers " + strAnswer;
    strFault += IsLockFree() ? "" : ", the lock is held";
    strFault += OpenDescriptors() == strFiles ? "" : ", a descriptor is left open";
    strFault +=
        CDataDirectory::ReadBytes(CDataPaths::ContactReg()) == strReg ? "" : ", store changed";
    return strCall + ": " + strFault;
}

// --- The tests ---------------------------------------------------------------------------------

class CEveryCallFails : public testing::TestWithParam<std::tuple<tag_Change, int>>
{
};

TEST_P(CEveryCallFails, Changing)
{
    const auto& [change, iSortType] = GetParam();
    const CStoreCase store(change, iSortType);
    RunAll(std::string(change.szName) + std::to_string(iSortType),
           [&store](const tag_Failures& failures, int iGranted)
           {
               // Each of the two in one order: most allocations are the same.
               const bool bDone = failures.eGroup == CALLS_MEMORY &&
                                  failures.bOnce == (store.SortType() == STORE_ORDER_NAME);
               store.Restore();
               return bDone ? "" : RunChange(store, failures, iGranted);
           });
}

INSTANTIATE_TEST_SUITE_P(Faults, CEveryCallFails,
                         testing::Combine(testing::ValuesIn(AllChanges()), testing::Values(0, 1)),
                         [](const auto& parameters)
                         {
                             return std::string(std::get<0>(parameters.param).szName) +
                                    (std::get<1>(parameters.param) == 0 ? "ByName" : "ByTime");
                         });

TEST(Faults, EveryCallFailsReading)
{
    const CStoreCase store(AllChanges().back(), STORE_ORDER_TIME);
    store.Restore();
    for (const tag_Reading& reading : AllReadings())
    {
        const std::string strExpected = Read(reading, {"", CALLS_NONE, 0, true}, 0);
        ASSERT_EQ(strExpected.find("0"), 0U) << reading.szName;
        RunAll(reading.szName, [&](const tag_Failures& failures, int iGranted)
               { return RunReading(reading, strExpected, failures, iGranted); });
    }
}

// The lock is refused five times: nobody's store is read.
TEST(Faults, SearchesNobodyWithoutTheLock)
{
    const CStoreCase store(AllChanges().back(), STORE_ORDER_NAME);
    store.Restore();
    EXPECT_EQ(Read(AllReadings()[0], {"", CALLS_LOCK, EWOULDBLOCK, false}, 0), "0 nobody");
}

} // namespace
