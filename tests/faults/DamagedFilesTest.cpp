// Stores, pinyin tables and registration records damaged at random under every call: each comes
// back with a result code, nothing is read or written out of bounds, and a build puts all in order.

#include "tests/faults/StoreCase.h"

#include <filesystem>
#include <gtest/gtest.h>
#include <random>

namespace
{

constexpr int ROUNDS = 2000;
constexpr int REPAIR_EVERY = 8; // rounds
constexpr int CALLS = 3;        // of a round

std::mt19937 g_random;

size_t Pick(size_t uNum)
{
    return g_random() % uNum;
}

// What becomes of a file: bytes cut off, taken out, put in or overwritten.
std::string Damaged(std::string strFile)
{
    const size_t uSize = strFile.size();
    // Most damage hits what is in use, at the start.
    const size_t uAt = Pick(Pick(2) == 0 ? uSize : std::min<size_t>(uSize, 5000));
    const size_t uLength = std::min<size_t>(1 + Pick(Pick(2) == 0 ? 8 : 3000), uSize - uAt);
    std::string strNew(uLength, "\x00\x7f\xff\x80"[Pick(4)]);
    if (Pick(3) != 0)
    {
        std::generate_n(strNew.begin(), uLength, [] { return static_cast<char>(g_random()); });
    }
    const size_t TAKEN[] = {std::string::npos, uLength, 0, uLength, uLength};
    const size_t PUT[] = {0, 0, uLength, uLength, uLength};
    const size_t uKind = Pick(5);
    return strFile.replace(uAt, TAKEN[uKind], strNew, 0, PUT[uKind]);
}

int32_t AnyCount()
{
    constexpr int32_t COUNTS[] = {0,       1,         4,    5,    6,        999,
                                  1000,    1001,      1005, 1006, 3050402,  3050403,
                                  6101805, INT32_MAX, -1,   -5,   INT32_MIN};
    return COUNTS[Pick(std::size(COUNTS))];
}

TEST(Faults, DamagedFilesHarmNobody)
{
    const CStoreCase store(AllChanges()[0], STORE_ORDER_NAME);
    const char* const PATHS[] = {CDataPaths::ContactReg(), CDataPaths::ContactRecords(),
                                 CDataPaths::PinyinMapping(), CDataPaths::PinyinSource()};
    store.Restore();
    std::vector<std::string> vWhole;
    std::transform(std::begin(PATHS), std::end(PATHS), std::back_inserter(vWhole),
                   &CDataDirectory::ReadBytes);
    g_random.seed(g_uSeed);
    CLocalizerLogic logic;
    for (int iRound = 0; iRound < ROUNDS; ++iRound)
    {
        SCOPED_TRACE(iRound);
        const size_t uFile = Pick(8) == 0 ? 2 + Pick(2) : Pick(2);
        CDataDirectory::WriteBytes(PATHS[uFile], Damaged(vWhole[uFile]));
        if (Pick(4) == 0)
        {
            SetReg({AnyCount(), AnyCount(), AnyCount()});
        }
        for (int i = 0; i < 2 * CALLS; ++i)
        {
            const auto& operations = i % 2 == 0 ? AllReadings() : AllChanges();
            const tag_Operation& operation = operations[Pick(operations.size())];
            tag_Answer answer;
            operation.pfnRun(logic, answer);
            EXPECT_TRUE(IsResult(answer.iRet)) << operation << answer.iRet;
            EXPECT_TRUE(answer.iRet == 0 || answer.pResult == nullptr);
            TextOf(logic, answer);
        }
        if (uFile > 1)
        {
            CDataDirectory::WriteBytes(PATHS[2], vWhole[2]);
            CDataDirectory::WriteBytes(PATHS[3], vWhole[3]);
        }
        if (iRound % REPAIR_EVERY == 0)
        {
            logic.SetSortType(STORE_ORDER_NAME);
            ASSERT_EQ(logic.MemInit(true), 0);
            std::filesystem::resize_file(PATHS[0], sizeof(tag_ContactReg)); // it may be longer
            ASSERT_EQ(store.RepairFault(), "");
        }
        store.Restore();
    }
}

} // namespace
