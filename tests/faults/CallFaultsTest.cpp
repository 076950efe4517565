// Every call of the C library and every allocation fails once, under every operation of the
// facade: the operation reports it or gets by, gives back what it took, and leaves a store that is
// right or that the next notification makes right.

#include "tests/faults/CallFaults.h"
#include "Common/DataPaths.h"
#include "tests/Support/ChildProcess.h"
#include "tests/Support/StoreFiles.h"
#include "tests/faults/StoreCase.h"

#include <cerrno>
#include <climits>
#include <fcntl.h>
#include <gtest/gtest.h>
#include <sys/file.h>
#include <unistd.h>

namespace
{

constexpr unsigned int HANGS = 60; // seconds; a call takes one or two

constexpr tag_Failures FAILURES[] = {
    {"NoDescriptor", CALLS_FILES, EMFILE, true}, {"InputOutput", CALLS_FILES, EIO, true},
    {"DiskFull", CALLS_ROOM, ENOSPC, false},     {"Refused", CALLS_LOCK, EWOULDBLOCK, true},
    {"NoMemory", CALLS_MEMORY, ENOMEM, true},    {"NoMoreMemory", CALLS_MEMORY, ENOMEM, false},
};

// What is wrong after an operation that met a failure.
using FnExamine = std::function<std::string(CLocalizerLogic& logic, const tag_Answer& answer)>;

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

// Runs an operation, of whose calls so many succeed. Tells the call that failed and, behind ": ",
// what is wrong then; "" when all calls succeeded.
std::string Run(const tag_Operation& operation, const tag_Failures& failures, int iGranted,
                const FnExamine& fnExamine)
{
    const std::string strFiles = OpenDescriptors();
    std::string strFault;
    std::string strCall;
    {
        CLocalizerLogic logic;
        tag_Answer answer;
        {
            const CCallFault fault(failures, iGranted);
            operation.pfnRun(logic, answer);
        }
        strCall = CCallFault::Failed();
        strFault = IsLockFree() ? fnExamine(logic, answer) : "the lock is held";
    }
    if (strFault.empty() && OpenDescriptors() != strFiles)
    {
        strFault = "a descriptor is left open";
    }
    return strCall.empty() ? "" : strCall + ": " + strFault;
}

// Lets one call after another fail, in a child that a finding ends.
void RunAll(const std::string& strCase, const tag_Operation& operation, const FnExamine& fnExamine,
            const std::function<bool(const tag_Failures&)>& fnPrepare)
{
    const CShared<int> call;
    for (const tag_Failures& failures : FAILURES)
    {
        const auto fnBody = [&]
        {
            for (;; ++*call)
            {
                alarm(HANGS);
                std::string strTold =
                    fnPrepare(failures) ? Run(operation, failures, *call, fnExamine) : "";
                if (strTold.empty() || strTold.back() != ' ')
                {
                    return strTold;
                }
            }
        };
        std::string strFinding = "none yet";
        for (*call = 0; !strFinding.empty(); ++*call)
        {
            strFinding = CChild(fnBody, HANGS).Text();
            EXPECT_EQ(strFinding, "") << strCase << "/" << failures.szName << ", call " << *call;
        }
    }
}

class CEveryCallFails : public testing::TestWithParam<std::tuple<tag_Operation, int>>
{
protected:
    // The store right after the change, and after the same object is told of something else.
    static std::string FaultAfter(const CStoreCase& store, bool bReports, CLocalizerLogic& logic,
                                  int iRet)
    {
        std::string strFault;
        const STORE_KIND eKind = store.KindOf(CStoreCase::Present(), &strFault);
        if (eKind == KIND_WRONG || !IsResult(iRet))
        {
            return strFault + " result " + std::to_string(iRet);
        }
        if (bReports && iRet == 0 && eKind != KIND_AFTER)
        {
            return "success without a store";
        }
        logic.OnStatusUpdatesTableChanged(0, nullptr);
        const bool bTold = iRet != 0 && eKind != KIND_MARKED; // the caller knows and tries again
        strFault = bTold ? "" : store.RepairFault();
        if (strFault.empty() && CLocalizerLogic().MemInit(false) != 0)
        {
            return "the next process cannot start";
        }
        return strFault.empty() && eKind == KIND_NONE ? store.RepairFault() : strFault;
    }
};

TEST_P(CEveryCallFails, Changing)
{
    const tag_Operation& change = std::get<0>(GetParam());
    const int iSortType = std::get<1>(GetParam());
    const CStoreCase store(change, iSortType);
    const bool bReports = std::strstr(change.szName, "Build") != nullptr;
    RunAll(
        std::string(change.szName) + std::to_string(iSortType), change,
        [&](CLocalizerLogic& logic, const tag_Answer& answer)
        { return FaultAfter(store, bReports, logic, answer.iRet); },
        [&](const tag_Failures& failures)
        {
            store.Restore();
            // Each of the two in one order: most allocations are the same.
            return failures.eGroup != CALLS_MEMORY || failures.bOnce == (iSortType == 1);
        });
}

INSTANTIATE_TEST_SUITE_P(Faults, CEveryCallFails,
                         testing::Combine(testing::ValuesIn(AllChanges()), testing::Values(0, 1)));

TEST(Faults, EveryCallFailsReading)
{
    const CStoreCase store(AllChanges().back(), STORE_ORDER_TIME);
    store.Restore();
    const tag_ContactReg reg = Reg();
    for (const tag_Operation& reading : AllReadings())
    {
        CLocalizerLogic whole;
        tag_Answer expected;
        reading.pfnRun(whole, expected);
        const std::string strExpected = TextOf(whole, expected);
        ASSERT_EQ(strExpected.find("0"), 0U) << reading.szName;
        const bool bSearches = strExpected.find("keys") != std::string::npos;
        RunAll(
            reading.szName, reading,
            [&](CLocalizerLogic& logic, const tag_Answer& answer) -> std::string
            {
                const bool bSet = answer.iRet != 0 && answer.pResult != nullptr;
                const std::string strAnswer = TextOf(logic, answer);
                // A store that cannot be read has nobody in it.
                const bool bRight = strAnswer == strExpected || strAnswer == "-1" ||
                                    strAnswer == "-1000" || (bSearches && strAnswer == "0 nobody");
                return bRight && !bSet && Reg() == reg ? "" : "answers " + strAnswer;
            },
            [](const tag_Failures&) { return true; });
    }
}

// The lock is refused five times: nobody's store is read.
TEST(Faults, SearchesNobodyWithoutTheLock)
{
    const CStoreCase store(AllChanges().back(), STORE_ORDER_NAME);
    store.Restore();
    CLocalizerLogic logic;
    tag_Answer answer;
    {
        const CCallFault fault({"", CALLS_LOCK, EWOULDBLOCK, false}, 0);
        AllReadings()[0].pfnRun(logic, answer);
    }
    EXPECT_EQ(TextOf(logic, answer), "0 nobody");
}

} // namespace
