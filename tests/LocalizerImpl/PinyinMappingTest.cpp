// The pinyin table: its shared copy, its mappings and handles, codes and syllables.

#include "tests/LocalizerImpl/LocalizerFixture.h"

#include "Common/DataPaths.h"
#include "LocalizerImpl/FileStamp.h"
#include "LocalizerImpl/ReadingSets.h"
#include "LocalizerImpl/Syllables.h"
#include "tests/Support/MemoryFailure.h"

#include <sys/stat.h>
#include <sys/time.h>

#include <algorithm>
#include <ctime>
#include <cwchar>
#include <vector>

namespace
{

using Manager = CQVLocalizerManager;

constexpr size_t TABLE_BYTES = 709412;

class PinyinFile : public testing::Test
{
protected:
    std::string Source() const { return m_data.File("pyfile.bin"); }
    std::string Copy() const { return m_data.File("PyFileMappint.bin"); }

    CDataDirectory m_data;
};

// Whether the text begins a syllable: the syllables in the order of their table, one by one.
bool BeginsSyllable(const std::wstring& strText)
{
    return std::any_of(std::begin(g_pyWords), std::end(g_pyWords),
                       [&](const wchar_t* szSyllable)
                       { return std::wcsncmp(szSyllable, strText.c_str(), strText.size()) == 0; });
}

} // namespace

TEST_F(PinyinFile, EndsInZerosWhenItsSourceIsShort)
{
    for (const size_t uLength : {size_t{0}, TABLE_BYTES - 1, TABLE_BYTES})
    {
        CDataDirectory::WriteBytes(Copy(), std::string(TABLE_BYTES + 3, 'x')); // of an older build
        CDataDirectory::WriteBytes(Source(), std::string(uLength, 'y'));
        ASSERT_EQ(Manager::InitMapFile(), 0);
        std::string strExpected(uLength, 'y');
        strExpected.resize(TABLE_BYTES, '\0');
        EXPECT_TRUE(CDataDirectory::ReadBytes(Copy()) == strExpected + "xxx") << uLength;
    }
}

TEST_F(PinyinFile, IsNotMadeFromWhatCannotBeRead)
{
    EXPECT_EQ(Manager::InitMapFile(), -1000) << "no source";
    ASSERT_EQ(mkdir(Source().c_str(), 0700), 0);
    EXPECT_EQ(Manager::InitMapFile(), -1000) << "a directory in its place";
    ASSERT_EQ(std::remove(Source().c_str()), 0);
    m_data.InstallPinyinTable();
    {
        const CMemoryFailure noMemory(0);
        EXPECT_EQ(Manager::InitMapFile(), -1000);
    }
    EXPECT_FALSE(CDataDirectory::Exists(Copy()));
}

TEST_F(PinyinFile, IsMappedOnlyWhenItIsThereAndWhole)
{
    void* pMap = nullptr;
    EXPECT_EQ(Manager::MemInit(&pMap), -1000);
    CDataDirectory::WriteBytes(Copy(), std::string(TABLE_BYTES - 1, 'x'));
    EXPECT_EQ(Manager::MemInit(&pMap), -1000);
    CDataDirectory::WriteBytes(Copy(), std::string(TABLE_BYTES, 'x'));
    ASSERT_EQ(Manager::MemInit(&pMap), 0);
    EXPECT_EQ(static_cast<char*>(pMap)[TABLE_BYTES - 1], 'x');
    EXPECT_EQ(Manager::MemRelease(pMap), 0);
}

TEST(PinyinHandle, IsRefusedUnlessItIsPositive)
{
    const std::string strCall = "CQVLocalizerManager::ReleasePinYinFileMapping ";
    const CLogCapture log;
    Manager::ReleasePinYinFileMapping(-1);
    const std::vector<tag_LogLine> vExpected = {
        {ERROR_LINE, "QV_Localize", strCall + "the input mapping is -1 "},
        {ERROR_LINE, "QV_Localize", strCall + "the input mapping is wrong!"}};
    EXPECT_EQ(log.Lines(), vExpected);
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
    using FnChange = void (*)(tag_FileStamp&);
    const FnChange OTHERS[] = {
        [](tag_FileStamp& other) { ++other.uDevice; },
        [](tag_FileStamp& other) { ++other.uInode; },
        [](tag_FileStamp& other) { ++other.llSize; },
        [](tag_FileStamp& other) { ++other.llModified; },
        [](tag_FileStamp& other) { ++other.llChanged; },
        [](tag_FileStamp& other) { ++other.iModifiedNs; },
        [](tag_FileStamp& other) { ++other.iChangedNs; },
    };
    for (const FnChange fnChange : OTHERS)
    {
        tag_FileStamp other = stamp;
        EXPECT_TRUE(IsSameStamp(stamp, other));
        fnChange(other);
        EXPECT_FALSE(IsSameStamp(stamp, other));
    }
}

// Sets that were read from a file which could still change without a trace are not kept.
TEST_F(LocalizerFixture, KeepsReadingSetsForASettledStampAlone)
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
