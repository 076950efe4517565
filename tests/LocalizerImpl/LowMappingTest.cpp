#include "LocalizerImpl/LowMapping.h"

#include "Common/DataPaths.h"
#include "LocalizerImpl/QVLocalizerManager.h"
#include "tests/Support/DataDirectory.h"
#include "tests/Support/LogCapture.h"

#include <gtest/gtest.h>
#include <sys/mman.h>

#include <cstring>
#include <fstream>
#include <string>
#include <vector>

namespace
{

// The part of the address space that the tests let handles lie in. Emulators of 32-bit systems
// map below its end by themselves, so the tests that need a high first mapping take less.
constexpr uintptr_t ROOM_BEGIN = 0x10000000;
constexpr uintptr_t ROOM_END = 0x30000000;
constexpr uintptr_t ROOM_STEP = 0x01000000;

class CLowMappingTest : public testing::Test
{
protected:
    CLowMappingTest()
    {
        m_directory.InstallPinyinTable();
        EXPECT_EQ(0, CQVLocalizerManager::InitMapFile());
        CLowMapping::SetLimit(ROOM_END);
    }
    ~CLowMappingTest() override { CLowMapping::SetLimit(0); }

    // How many mappings of the shared table the process has.
    static int TableMappings()
    {
        std::ifstream maps("/proc/self/maps");
        int iCount = 0;
        for (std::string strLine; std::getline(maps, strLine);)
        {
            iCount += strLine.find(CDataPaths::PinyinMapping()) != std::string::npos ? 1 : 0;
        }
        return iCount;
    }

    CDataDirectory m_directory;
    CLogCapture m_log;
};

} // namespace

TEST_F(CLowMappingTest, MapsAgainBelowTheLimitAndReleases)
{
    const long hMap = CQVLocalizerManager::CreatePinYinFileMapping();
    ASSERT_GT(hMap, 0);
    EXPECT_LT(static_cast<uintptr_t>(hMap), ROOM_END);
    EXPECT_EQ(1, TableMappings());
    EXPECT_EQ(CDataDirectory::ReadBytes(CDataPaths::PinyinMapping()),
              std::string(reinterpret_cast<const char*>(hMap), PY_FILE_SIZE));
    EXPECT_EQ(0, CQVLocalizerManager::ReleasePinYinFileMapping(hMap));
    EXPECT_EQ(0, TableMappings());
}

TEST_F(CLowMappingTest, NeverTakesThePlaceOfAnotherMappingAndGivesUpWithItsLine)
{
    void* pTaken = mmap(reinterpret_cast<void*>(ROOM_BEGIN), ROOM_STEP, PROT_READ | PROT_WRITE,
                        MAP_PRIVATE | MAP_ANONYMOUS, -1, 0);
    ASSERT_NE(MAP_FAILED, pTaken);
    std::memset(pTaken, 'm', ROOM_STEP);
    if (reinterpret_cast<uintptr_t>(pTaken) == ROOM_BEGIN)
    {
        CLowMapping::SetLimit(ROOM_BEGIN + ROOM_STEP);
        const long hMap = CQVLocalizerManager::CreatePinYinFileMapping();
        if (hMap == -1)
        {
            const std::vector<std::string> vExpected = {
                "CQVLocalizerManager::CreatePinYinFileMapping memInit error code = -1000"};
            EXPECT_EQ(vExpected, m_log.Texts(6));
        }
        else // an emulator may answer a hint that is taken with an address below it
        {
            EXPECT_LT(static_cast<uintptr_t>(hMap), ROOM_BEGIN);
            EXPECT_EQ(0, CQVLocalizerManager::ReleasePinYinFileMapping(hMap));
        }
        EXPECT_EQ(0, TableMappings());
        EXPECT_EQ(std::string(ROOM_STEP, 'm'),
                  std::string(static_cast<const char*>(pTaken), ROOM_STEP));
    }
    munmap(pTaken, ROOM_STEP);
}
