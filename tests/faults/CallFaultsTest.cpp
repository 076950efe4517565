// Every call of the C library and every allocation fails once, under every operation of the
// facade: the operation reports it or gets by, gives back what it took, and leaves a store that is
// right or that the next notification makes right.

#include "tests/faults/CallFaults.h"

#include "LocalizerImpl/QVLocalizerManager.h"
#include "tests/Support/ChildProcess.h"
#include "tests/faults/StoreCase.h"

#include <cerrno>
#include <filesystem>
#include <functional>
#include <gtest/gtest.h>
#include <memory>

namespace
{

constexpr tag_Failures FAILURES[] = {
    {"NoDescriptor", CALLS_FILES, EMFILE, true},   {"InputOutput", CALLS_FILES, EIO, true},
    {"DiskFull", CALLS_ROOM, ENOSPC, false},       {"Refused", CALLS_LOCK, EWOULDBLOCK, true},
    {"NoLocks", CALLS_LOCK, ENOLCK, false},        {"NoMemory", CALLS_MEMORY, ENOMEM, true},
    {"NoMoreMemory", CALLS_MEMORY, ENOMEM, false},
};

// What is wrong after an operation that met a failure.
using FnExamine = std::function<std::string(CLocalizerLogic& logic, const tag_Answer& answer)>;

// Lets one call after another fail, each time in the store as it was.
void FailEachCall(const CStoreCase& store, const tag_Operation& operation,
                  const tag_Failures& failures, const FnExamine& fnExamine)
{
    const char* szFailed = "none yet";
    for (int iCall = 0; *szFailed != 0 && !testing::Test::HasFailure(); ++iCall)
    {
        store.Restore();
        const std::ptrdiff_t iDescriptors = OpenDescriptors();
        auto pLogic = std::make_unique<CLocalizerLogic>();
        tag_Answer answer;
        {
            const CCallFault fault(failures, iCall);
            operation.pfnRun(*pLogic, answer);
        }
        szFailed = CCallFault::Failed();
        EXPECT_TRUE(CLockHolder().IsHeld()) << "the operation has kept the lock";
        EXPECT_EQ(fnExamine(*pLogic, answer), "");
        pLogic.reset();
        EXPECT_EQ(OpenDescriptors(), iDescriptors);
        EXPECT_FALSE(testing::Test::HasFailure())
            << operation << '/' << failures.szName << ", call " << iCall << ": " << szFailed;
    }
}

// What is wrong with the store right after a change and after the same object is told of something
// else.
std::string FaultAfter(const CStoreCase& store, bool bReports, CLocalizerLogic& logic, int iRet)
{
    std::string strFault;
    const STORE_KIND eKind = store.KindOf(ReadStore(), &strFault);
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

using CEveryCallFails = testing::TestWithParam<std::tuple<tag_Operation, int>>;

TEST_P(CEveryCallFails, Changing)
{
    const tag_Operation& change = std::get<0>(GetParam());
    const int iSortType = std::get<1>(GetParam());
    const CStoreCase store(change, iSortType);
    const bool bReports = std::strstr(change.szName, "Build") != nullptr;
    for (const tag_Failures& failures : FAILURES)
    {
        // Each of the two of memory in one order: most allocations are the same.
        if (failures.eGroup != CALLS_MEMORY || failures.bOnce == (iSortType == STORE_ORDER_TIME))
        {
            FailEachCall(store, change, failures,
                         [&](CLocalizerLogic& logic, const tag_Answer& answer)
                         { return FaultAfter(store, bReports, logic, answer.iRet); });
        }
    }
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
        ASSERT_EQ(strExpected.find('0'), 0U) << reading;
        const bool bSearches = strExpected.find("keys") != std::string::npos;
        const auto fnExamine = [&](CLocalizerLogic& logic, const tag_Answer& answer) -> std::string
        {
            const bool bSet = answer.iRet != 0 && answer.pResult != nullptr;
            const std::string strAnswer = TextOf(logic, answer);
            // A store that cannot be read has nobody in it.
            const bool bRight = strAnswer == strExpected || strAnswer == "-1" ||
                                strAnswer == "-1000" || (bSearches && strAnswer == "0 nobody");
            return bRight && !bSet && Reg() == reg ? "" : "answers " + strAnswer;
        };
        for (const tag_Failures& failures : FAILURES)
        {
            FailEachCall(store, reading, failures, fnExamine);
        }
    }
}

// Searches keep what they read for as long as the shared table has the same time, which a write
// through a mapping need not change.
TEST(Faults, ACopiedTableHasANewTime)
{
    static const auto past = std::filesystem::file_time_type::clock::now() - std::chrono::hours(1);
    const CDataDirectory directory;
    directory.InstallPinyinTable();
    WatchMappings(
        [](MAP_EVENT eEvent, const tag_Mapping& mapping)
        {
            if (eEvent == MAP_FLUSHED && std::strcmp(mapping.szFile, "PyFileMappint.bin") == 0)
            {
                std::filesystem::last_write_time(CDataPaths::PinyinMapping(), past);
            }
        });
    EXPECT_EQ(CQVLocalizerManager::InitMapFile(), 0);
    WatchMappings(nullptr);
    EXPECT_NE(std::filesystem::last_write_time(CDataPaths::PinyinMapping()), past);
}

} // namespace
