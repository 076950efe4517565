// The pinyin table: its shared copy, its mappings and handles, codes and syllables.

#include "tests/LocalizerImpl/LocalizerFixture.h"

#include "Common/DataPaths.h"
#include "LocalizerImpl/FileStamp.h"
#include "LocalizerImpl/LowMapping.h"
#include "LocalizerImpl/ReadingSets.h"
#include "LocalizerImpl/Syllables.h"
#include "tests/Support/MemoryFailure.h"

#include <sys/mman.h>
#include <sys/stat.h>
#include <sys/time.h>

#include <algorithm>
#include <ctime>
#include <cwchar>
#include <fstream>
#include <vector>

namespace
{

using Manager = CQVLocalizerManager;

constexpr size_t TABLE_BYTES = 709412;

// The part of the address space that the tests let handles lie in. Emulators of 32-bit systems
// map below its end by themselves, so the tests that need a high first mapping take less.
constexpr uintptr_t ROOM_BEGIN = 0x10000000;
constexpr uintptr_t ROOM_END = 0x30000000;
constexpr uintptr_t ROOM_STEP = 0x01000000;

class PinyinTable : public LocalizerFixture
{
protected:
    PinyinTable() { CLowMapping::SetLimit(ROOM_END); }
    ~PinyinTable() override { CLowMapping::SetLimit(0); }

    std::string Source() const { return m_data.File("pyfile.bin"); }
    std::string Copy() const { return m_data.File("PyFileMappint.bin"); }

    // How many more mappings of the shared table the process has.
    static int OtherMappings()
    {
        std::ifstream maps("/proc/self/maps");
        int iCount = -1;
        for (std::string strLine; std::getline(maps, strLine);)
        {
            iCount += strLine.find(CDataPaths::PinyinMapping()) != std::string::npos ? 1 : 0;
        }
        return iCount;
    }
};

// Whether the text begins a syllable: the syllables in the order of their table, one by one.
bool BeginsSyllable(const std::wstring& strText)
{
    return std::any_of(std::begin(g_pyWords), std::end(g_pyWords),
                       [&](const wchar_t* szSyllable)
                       { return std::wcsncmp(szSyllable, strText.c_str(), strText.size()) == 0; });
}

} // namespace

TEST_F(PinyinTable, IsCopiedAndMappedWhenItIsThereAndWhole)
{
    void* pMap = nullptr;
    for (const size_t uLength : {size_t{0}, TABLE_BYTES - 1, TABLE_BYTES})
    {
        CDataDirectory::WriteBytes(Copy(), std::string(TABLE_BYTES + 3, 'x')); // of an older build
        CDataDirectory::WriteBytes(Source(), std::string(uLength, 'y'));
        ASSERT_EQ(Manager::InitMapFile(), 0);
        std::string strExpected(uLength, 'y');
        strExpected.resize(TABLE_BYTES, '\0');
        EXPECT_TRUE(CDataDirectory::ReadBytes(Copy()) == strExpected + "xxx") << uLength;
    }
    ASSERT_EQ(Manager::MemInit(&pMap), 0);
    EXPECT_EQ(static_cast<char*>(pMap)[TABLE_BYTES - 1], 'y');
    EXPECT_EQ(Manager::MemRelease(pMap), 0);
    CDataDirectory::WriteBytes(Copy(), std::string(TABLE_BYTES - 1, 'x'));
    EXPECT_EQ(Manager::MemInit(&pMap), -1000);
    RemoveTable();
    EXPECT_EQ(Manager::MemInit(&pMap), -1000);
    {
        const CMemoryFailure noMemory(0);
        EXPECT_EQ(Manager::InitMapFile(), -1000);
    }
    ASSERT_EQ(std::remove(Source().c_str()), 0);
    EXPECT_EQ(Manager::InitMapFile(), -1000) << "no source";
    ASSERT_EQ(mkdir(Source().c_str(), 0700), 0);
    EXPECT_EQ(Manager::InitMapFile(), -1000) << "a directory in its place";
    EXPECT_FALSE(CDataDirectory::Exists(Copy()));
}

TEST_F(PinyinTable, IsMappedBelowTheLimitAsAHandle)
{
    const long hMap = Manager::CreatePinYinFileMapping();
    ASSERT_GT(hMap, 0);
    EXPECT_LT(static_cast<uintptr_t>(hMap), ROOM_END);
    EXPECT_EQ(1, OtherMappings());
    EXPECT_EQ(CDataDirectory::ReadBytes(Copy()),
              std::string(reinterpret_cast<const char*>(hMap), PY_FILE_SIZE));
    EXPECT_EQ(0, Manager::ReleasePinYinFileMapping(hMap));
    EXPECT_EQ(0, OtherMappings());
    const CLogCapture log;
    Manager::ReleasePinYinFileMapping(-1);
    const std::string strCall = "CQVLocalizerManager::ReleasePinYinFileMapping the input mapping ";
    EXPECT_EQ(log.Texts(ERROR_LINE), (Lines{strCall + "is -1 ", strCall + "is wrong!"}));
}

TEST_F(PinyinTable, NeverTakesThePlaceOfAnotherMapping)
{
    void* pTaken = mmap(reinterpret_cast<void*>(ROOM_BEGIN), ROOM_STEP, PROT_READ | PROT_WRITE,
                        MAP_PRIVATE | MAP_ANONYMOUS, -1, 0);
    ASSERT_NE(MAP_FAILED, pTaken);
    std::memset(pTaken, 'm', ROOM_STEP);
    if (reinterpret_cast<uintptr_t>(pTaken) == ROOM_BEGIN)
    {
        CLowMapping::SetLimit(ROOM_BEGIN + ROOM_STEP);
        const CLogCapture log;
        const long hMap = Manager::CreatePinYinFileMapping();
        if (hMap == -1)
        {
            EXPECT_EQ(log.Texts(ERROR_LINE),
                      Lines{"CQVLocalizerManager::CreatePinYinFileMapping memInit error code = "
                            "-1000"});
        }
        else // an emulator may answer a hint that is taken with an address below it
        {
            EXPECT_LT(static_cast<uintptr_t>(hMap), ROOM_BEGIN);
            EXPECT_EQ(0, Manager::ReleasePinYinFileMapping(hMap));
        }
        EXPECT_EQ(0, OtherMappings());
        EXPECT_EQ(std::string(ROOM_STEP, 'm'),
                  std::string(static_cast<const char*>(pTaken), ROOM_STEP));
    }
    munmap(pTaken, ROOM_STEP);
}

// A file that was written just now could change once more without a trace, whatever its own time
// has been set to.
TEST(FileStamp, IsSettledOnceBothTimesArePast)
{
    const CDataDirectory directory;
    const std::string strFile = directory.File("file");
    CDataDirectory::WriteBytes(strFile, "file");
    const auto fnSetTime = [&strFile](time_t seconds)
    {
        const timeval times[] = {{seconds, 0}, {seconds, 0}};
        EXPECT_EQ(utimes(strFile.c_str(), times), 0);
    };
    time_t start = 0;
    tag_FileStamp stamp = {};
    do // until nothing held the test up
    {
        start = std::time(nullptr);
        fnSetTime(start - 1000);
        stamp = ReadFileStamp(strFile.c_str());
    } while (std::time(nullptr) - start > 1);
    EXPECT_FALSE(stamp.bSettled);
    EXPECT_EQ(stamp.llModified, start - 1000);
    fnSetTime(start + 1000);
    EXPECT_FALSE(ReadFileStamp(strFile.c_str()).bSettled);
    EXPECT_TRUE(ReadFileStamp("/usr/lib").bSettled);
    EXPECT_FALSE(ReadFileStamp("no file").bSettled);
    for (size_t i = 0; i < offsetof(tag_FileStamp, bSettled); i += sizeof(int32_t))
    {
        tag_FileStamp other = stamp;
        EXPECT_TRUE(IsSameStamp(stamp, other));
        reinterpret_cast<char*>(&other)[i] ^= 1;
        EXPECT_FALSE(IsSameStamp(stamp, other)) << i;
    }
}

// Sets that were read from a file which could still change without a trace are not kept.
TEST_F(PinyinTable, KeepsReadingSetsForASettledStampAlone)
{
    std::vector<PYOFWORDS> vOther(m_pMap, m_pMap + PY_WORD_COUNT);
    std::strcpy(vOther[0].szPinyin[0], "aaa");
    tag_FileStamp stamp = ReadFileStamp(CDataPaths::PinyinMapping());
    const auto fnFirstReading = [&](const PYOFWORDS* pMap)
    { return std::string(CReadingSets::Of(pMap, stamp)->RecordOf(LOC_HANZI_BASE).szPinyin[0]); };
    stamp.bSettled = false;
    const std::string strFirst = fnFirstReading(m_pMap);
    EXPECT_EQ(fnFirstReading(vOther.data()), "aaa");
    stamp.bSettled = true;
    const CReadingSets::Ptr kept = CReadingSets::Of(vOther.data(), stamp);
    EXPECT_EQ(CReadingSets::Of(m_pMap, stamp).get(), kept.get());
    ++stamp.iChangedNs;
    EXPECT_EQ(fnFirstReading(m_pMap), strFirst);
    EXPECT_STREQ(kept->RecordOf(LOC_HANZI_BASE).szPinyin[0], "aaa") << "still in use";
}

// Every beginning of every syllable, and everything one unit away from it.
TEST(Syllables, AreFoundByTheirBeginningsAlone)
{
    const std::wstring strUnits = L"abcdefghijklmnopqrstuvwxyzA`{0\xFFFF\x7FFFFFFF\x80000061";
    for (const std::wstring strSyllable : g_pyWords)
    {
        for (size_t uLength = 0; uLength <= strSyllable.size(); ++uLength)
        {
            for (const wchar_t unit : strUnits)
            {
                std::wstring strText = strSyllable.substr(0, uLength) + unit;
                ASSERT_EQ(Manager::IsPyWords(strText.data()), BeginsSyllable(strText))
                    << testing::PrintToString(strText);
            }
        }
    }
}
