// The pinyin table: its shared copy, its mappings and handles, codes and syllables.

#include "Common/DataPaths.h"
#include "LocalizerImpl/FileStamp.h"
#include "LocalizerImpl/LowMapping.h"
#include "LocalizerImpl/ReadingSets.h"
#include "LocalizerImpl/Syllables.h"
#include "tests/LocalizerImpl/LocalizerFixture.h"

#include <ctime>
#include <filesystem>
#include <fstream>
#include <set>
#include <sys/mman.h>
#include <sys/time.h>
#include <vector>

namespace
{

namespace fs = std::filesystem;
using Manager = CQVLocalizerManager;

constexpr size_t TABLE_BYTES = 709412;

// Below this address the tests let handles lie.
constexpr uintptr_t ROOM_END = 0x30000000;

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

} // namespace

TEST_F(PinyinTable, IsCopiedAndMappedWhenItIsThereAndWhole)
{
    void* pMap = nullptr;
    for (const size_t uLength : {size_t{0}, TABLE_BYTES - 1, TABLE_BYTES})
    {
        CDataDirectory::WriteBytes(Copy(), std::string(TABLE_BYTES + 3, 'x')); // of an older build
        CDataDirectory::WriteBytes(Source(), std::string(uLength, 'y'));
        ASSERT_EQ(Manager::InitMapFile(), 0);
        EXPECT_TRUE(CDataDirectory::ReadBytes(Copy()) ==
                    std::string(uLength, 'y') + std::string(TABLE_BYTES - uLength, '\0') + "xxx");
    }
    for (const size_t uLength : {TABLE_BYTES, TABLE_BYTES - 1})
    {
        fs::resize_file(Copy(), uLength);
        EXPECT_EQ(Manager::MemInit(&pMap), uLength == TABLE_BYTES ? 0 : -1000);
        Manager::MemRelease(pMap);
    }
    RemoveTable();
    EXPECT_EQ(Manager::MemInit(&pMap), -1000);
    fs::remove(Source());
    EXPECT_EQ(Manager::InitMapFile(), -1000) << "no source";
    EXPECT_FALSE(fs::exists(Copy()));
}

TEST_F(PinyinTable, IsMappedBelowTheLimitWhereNothingElseIs)
{
    const long hFree = Manager::CreatePinYinFileMapping();
    ASSERT_GT(hFree, 0);
    EXPECT_LT(hFree, static_cast<long>(ROOM_END));
    EXPECT_EQ(1, OtherMappings());
    EXPECT_EQ(CDataDirectory::ReadBytes(Copy()),
              std::string(reinterpret_cast<const char*>(hFree), PY_FILE_SIZE));
    EXPECT_EQ(0, Manager::ReleasePinYinFileMapping(hFree));
    EXPECT_EQ(0, OtherMappings());
    // What lies there now stays, and a mapping that comes to lie elsewhere above the limit goes.
    void* pTaken = mmap(reinterpret_cast<void*>(hFree), TABLE_BYTES, PROT_READ | PROT_WRITE,
                        MAP_PRIVATE | MAP_ANONYMOUS | MAP_FIXED_NOREPLACE, -1, 0);
    ASSERT_NE(pTaken, MAP_FAILED);
    std::memset(pTaken, 'm', TABLE_BYTES);
    const long hBeside = Manager::CreatePinYinFileMapping();
    EXPECT_LT(hBeside, static_cast<long>(ROOM_END));
    EXPECT_EQ(1, OtherMappings());
    EXPECT_EQ(0, Manager::ReleasePinYinFileMapping(hBeside));
    EXPECT_EQ(std::string(TABLE_BYTES, 'm'), std::string(static_cast<char*>(pTaken), TABLE_BYTES));
    munmap(pTaken, TABLE_BYTES);
    CLowMapping::SetLimit(1);
    const CLogCapture log;
    EXPECT_EQ(-1, Manager::CreatePinYinFileMapping());
    EXPECT_EQ(-1005, Manager::ReleasePinYinFileMapping(-1));
    const std::string strRelease = "CQVLocalizerManager::ReleasePinYinFileMapping the input ";
    EXPECT_EQ(log.Texts(ERROR_LINE),
              (Lines{"CQVLocalizerManager::CreatePinYinFileMapping memInit error code = -1000",
                     strRelease + "mapping is -1 ", strRelease + "mapping is wrong!"}));
}

// A file that was written just now could change once more without a trace, whatever its own time
// has been set to.
TEST(FileStamp, IsSettledOnceBothTimesArePast)
{
    const CDataDirectory directory;
    const std::string strFile = directory.File("file");
    CDataDirectory::WriteBytes(strFile, "file");
    tag_FileStamp stamp = {};
    for (const time_t seconds : {-1000, 1000})
    {
        time_t start = 0;
        do // until nothing held the test up
        {
            start = std::time(nullptr);
            const timeval times[] = {{start + seconds, 0}, {start + seconds, 0}};
            EXPECT_EQ(utimes(strFile.c_str(), times), 0);
            stamp = ReadFileStamp(strFile.c_str());
        } while (std::time(nullptr) - start > 1);
        EXPECT_FALSE(stamp.bSettled) << seconds;
        EXPECT_EQ(stamp.llModified, start + seconds);
    }
    EXPECT_TRUE(ReadFileStamp("/usr/lib").bSettled);
    EXPECT_FALSE(ReadFileStamp("no file").bSettled);
    EXPECT_TRUE(IsSameStamp(stamp, tag_FileStamp(stamp)));
    for (size_t i = 0; i < offsetof(tag_FileStamp, bSettled); i += sizeof(int32_t))
    {
        tag_FileStamp other = stamp;
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
    std::set<std::wstring> beginnings;
    for (const std::wstring strSyllable : g_pyWords)
    {
        for (size_t uLength = 0; uLength <= strSyllable.size(); ++uLength)
        {
            beginnings.insert(strSyllable.substr(0, uLength));
        }
    }
    for (const std::wstring& strBeginning : beginnings)
    {
        for (const wchar_t unit : strUnits)
        {
            std::wstring strText = strBeginning + unit;
            ASSERT_EQ(Manager::IsPyWords(strText.data()), beginnings.count(strText) != 0)
                << testing::PrintToString(strText);
        }
    }
}
