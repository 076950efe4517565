#include "LocalizerImpl/LowMapping.h"

#include "Common/DataPaths.h"
#include "Core/LocalizerCodes.h"
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

// Memory of the test's own, taken only where nothing is.
class CTakenMemory
{
public:
    CTakenMemory(uintptr_t uAddress, size_t uSize)
        : m_uSize(uSize),
          m_pMemory(mmap(reinterpret_cast<void*>(uAddress), uSize, PROT_READ | PROT_WRITE,
                         MAP_PRIVATE | MAP_ANONYMOUS, -1, 0))
    {
        if (m_pMemory != MAP_FAILED)
        {
            std::memset(m_pMemory, MARK, m_uSize);
        }
    }
    ~CTakenMemory()
    {
        if (m_pMemory != MAP_FAILED)
        {
            munmap(m_pMemory, m_uSize);
        }
    }
    CTakenMemory(const CTakenMemory&) = delete;
    CTakenMemory& operator=(const CTakenMemory&) = delete;

    bool IsAt(uintptr_t uAddress) const
    {
        return reinterpret_cast<uintptr_t>(m_pMemory) == uAddress;
    }
    bool IsUntouched() const
    {
        const std::string strBytes(static_cast<const char*>(m_pMemory), m_uSize);
        return strBytes == std::string(m_uSize, MARK);
    }

private:
    static constexpr char MARK = 'm';

    size_t m_uSize;
    void* m_pMemory;
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
    EXPECT_TRUE(m_log.Texts(6).empty());

    wchar_t szName[] = L"\u5F20\u4E09";
    wchar_t szCodes[CONTACT_MAX_KEY + 1] = {};
    EXPECT_EQ(0, CQVLocalizerManager::GetLocalizerString(hMap, szName, szCodes));
    EXPECT_TRUE(CQVLocalizerManager::IsHanZi(static_cast<unsigned short>(szCodes[0])));

    EXPECT_EQ(0, CQVLocalizerManager::ReleasePinYinFileMapping(hMap));
    EXPECT_EQ(0, TableMappings());
}

TEST_F(CLowMappingTest, NeverTakesThePlaceOfAnotherMapping)
{
    CTakenMemory taken(ROOM_BEGIN, ROOM_STEP);
    if (!taken.IsAt(ROOM_BEGIN))
    {
        GTEST_SKIP() << "something of the process lies there already";
    }
    const long hMap = CQVLocalizerManager::CreatePinYinFileMapping();
    ASSERT_GT(hMap, 0);
    EXPECT_LT(static_cast<uintptr_t>(hMap), ROOM_END);
    EXPECT_TRUE(taken.IsUntouched());
    EXPECT_EQ(0, CQVLocalizerManager::ReleasePinYinFileMapping(hMap));
    EXPECT_TRUE(taken.IsUntouched());
}

TEST_F(CLowMappingTest, FailsWithItsLineAndNothingMappedWhereNothingIsFree)
{
    // No hint lies below.
    CLowMapping::SetLimit(ROOM_BEGIN);
    EXPECT_EQ(-1, CQVLocalizerManager::CreatePinYinFileMapping());
    EXPECT_EQ(0, TableMappings());
    const std::vector<std::string> vExpected = {
        "CQVLocalizerManager::CreatePinYinFileMapping memInit error code = -1000"};
    EXPECT_EQ(vExpected, m_log.Texts(6));
}

TEST_F(CLowMappingTest, GivesUpWhenEveryHintLeadsElsewhere)
{
    CLowMapping::SetLimit(ROOM_BEGIN + ROOM_STEP);
    const CTakenMemory taken(ROOM_BEGIN, ROOM_STEP);
    if (!taken.IsAt(ROOM_BEGIN))
    {
        GTEST_SKIP() << "something of the process lies there already";
    }
    EXPECT_EQ(-1, CQVLocalizerManager::CreatePinYinFileMapping());
    EXPECT_EQ(0, TableMappings());
    EXPECT_TRUE(taken.IsUntouched());
}

TEST_F(CLowMappingTest, EveryAddressAboveTheSignIsNoHandle)
{
    CLowMapping::SetLimit(0);
    const uintptr_t uSign = ~(~uintptr_t{0} >> 1);
    EXPECT_TRUE(CLowMapping::IsHandle(reinterpret_cast<void*>(uSign - 4096)));
    EXPECT_FALSE(CLowMapping::IsHandle(reinterpret_cast<void*>(uSign)));
    EXPECT_FALSE(CLowMapping::IsHandle(MAP_FAILED));
}
