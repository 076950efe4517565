// The pinyin table: its shared copy, its mappings and handles, codes and syllables.

#include "tests/LocalizerImpl/LocalizerFixture.h"

#include "LocalizerImpl/Syllables.h"
#include "tests/Support/MemoryFailure.h"

#include <sys/mman.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cwchar>
#include <vector>

namespace
{

using Manager = CQVLocalizerManager;

constexpr size_t TABLE_BYTES = 709412;

bool IsMapped(void* pAddress)
{
    std::vector<unsigned char> vPages(TABLE_BYTES / 4096 + 1);
    return mincore(pAddress, TABLE_BYTES, vPages.data()) == 0;
}

class PinyinFile : public testing::Test
{
protected:
    std::string Source() const { return m_data.File("pyfile.bin"); }
    std::string Copy() const { return m_data.File("PyFileMappint.bin"); }

    CDataDirectory m_data;
};

using PinyinHandle = LocalizerFixture;

// Whether the text begins a syllable: the syllables in the order of their table, one by one.
bool BeginsSyllable(const std::wstring& strText)
{
    return std::any_of(std::begin(g_pyWords), std::end(g_pyWords),
                       [&](const wchar_t* szSyllable)
                       { return std::wcsncmp(szSyllable, strText.c_str(), strText.size()) == 0; });
}

} // namespace

TEST_F(PinyinFile, IsCopiedWhole)
{
    CDataDirectory::WriteBytes(Copy(), std::string(TABLE_BYTES + 3, 'x')); // of an older build
    m_data.InstallPinyinTable();
    const CLogCapture log;
    ASSERT_EQ(Manager::InitMapFile(), 0);
    EXPECT_TRUE(log.Lines().empty());
    const std::string strSource = CDataDirectory::ReadBytes(Source());
    ASSERT_EQ(strSource.size(), TABLE_BYTES);
    EXPECT_EQ(CDataDirectory::ReadBytes(Copy()), strSource + "xxx");
}

TEST_F(PinyinFile, EndsInZerosWhenItsSourceIsShort)
{
    for (const size_t uLength : {size_t{0}, size_t{1}, TABLE_BYTES - 1, TABLE_BYTES + 1})
    {
        CDataDirectory::WriteBytes(Copy(), std::string(TABLE_BYTES, 'x'));
        CDataDirectory::WriteBytes(Source(), std::string(uLength, 'y'));
        ASSERT_EQ(Manager::InitMapFile(), 0);
        std::string strExpected(uLength, 'y');
        strExpected.resize(TABLE_BYTES, '\0');
        EXPECT_EQ(CDataDirectory::ReadBytes(Copy()), strExpected) << uLength;
    }
}

TEST_F(PinyinFile, IsNotMadeFromWhatCannotBeRead)
{
    const CLogCapture log;
    EXPECT_EQ(Manager::InitMapFile(), -1000) << "no source";
    ASSERT_EQ(mkdir(Source().c_str(), 0700), 0);
    EXPECT_EQ(Manager::InitMapFile(), -1000) << "a directory in its place";
    EXPECT_FALSE(CDataDirectory::Exists(Copy()));
    ASSERT_EQ(rmdir(Source().c_str()), 0);
    m_data.InstallPinyinTable();
    {
        const CMemoryFailure noMemory(0);
        EXPECT_EQ(Manager::InitMapFile(), -1000);
    }
    EXPECT_FALSE(CDataDirectory::Exists(Copy()));
    EXPECT_TRUE(log.Lines().empty());
    ASSERT_EQ(mkdir(Copy().c_str(), 0700), 0);
    EXPECT_EQ(Manager::InitMapFile(), -1000) << "the copy cannot be made";
}

TEST_F(PinyinFile, IsMappedOnlyWhenItIsThereAndWhole)
{
    EXPECT_EQ(Manager::MemInit(nullptr), -1005);
    void* pMap = nullptr;
    EXPECT_EQ(Manager::MemInit(&pMap), -1000);
    EXPECT_EQ(pMap, MAP_FAILED);
    CDataDirectory::WriteBytes(Copy(), std::string(TABLE_BYTES - 1, 'x'));
    EXPECT_EQ(Manager::MemInit(&pMap), -1000);
    const CLogCapture log;
    EXPECT_EQ(Manager::MemRelease(nullptr), 0);
    EXPECT_EQ(Manager::MemRelease(MAP_FAILED), 0);
    EXPECT_TRUE(log.Lines().empty());
    CDataDirectory::WriteBytes(Copy(), std::string(TABLE_BYTES, 'x'));
    ASSERT_EQ(Manager::MemInit(&pMap), 0);
    EXPECT_EQ(static_cast<char*>(pMap)[TABLE_BYTES - 1], 'x');
    EXPECT_EQ(Manager::MemRelease(pMap), 0);
    EXPECT_FALSE(IsMapped(pMap));
}

TEST_F(PinyinHandle, MapsUntilItIsReleased)
{
    const long hMap = Manager::CreatePinYinFileMapping();
    ASSERT_GT(hMap, 0);
    void* pMap = reinterpret_cast<void*>(hMap);
    EXPECT_EQ(std::memcmp(pMap, m_pMap, TABLE_BYTES), 0);
    const CLogCapture log;
    Manager::ReleasePinYinFileMapping(hMap);
    EXPECT_FALSE(IsMapped(pMap));
    EXPECT_TRUE(log.Lines().empty());
}

TEST_F(PinyinHandle, IsMinusOneWithAnErrorLineWithoutATable)
{
    RemoveTable();
    const CLogCapture log;
    EXPECT_EQ(Manager::CreatePinYinFileMapping(), -1);
    ASSERT_FALSE(log.Lines().empty());
    EXPECT_EQ(log.Lines().back(),
              (tag_LogLine{ERROR_LINE, "QV_Localize",
                           "CQVLocalizerManager::CreatePinYinFileMapping memInit error code = "
                           "-1000"}));
}

TEST_F(PinyinHandle, IsRefusedUnlessItIsPositive)
{
    const std::string strCall = "CQVLocalizerManager::ReleasePinYinFileMapping ";
    for (const long hMap : {0L, -1L, -4096L})
    {
        const CLogCapture log;
        Manager::ReleasePinYinFileMapping(hMap);
        const std::vector<tag_LogLine> vExpected = {
            {ERROR_LINE, "QV_Localize",
             strCall + "the input mapping is " + std::to_string(hMap) + " "},
            {ERROR_LINE, "QV_Localize", strCall + "the input mapping is wrong!"}};
        EXPECT_EQ(log.Lines(), vExpected);
    }
}

TEST(LocalizerCode, BelongsToItsClassOverAll16Bits)
{
    for (unsigned u = 0; u <= 0xFFFF; ++u)
    {
        const auto uCode = static_cast<unsigned short>(u);
        ASSERT_EQ(Manager::IsHanZi(uCode), u >= 0x1000 && u <= 0x4C3D) << u;
        ASSERT_EQ(Manager::IsGBWord(uCode), u < 15422) << u;
        ASSERT_EQ(Manager::IsAlpha(uCode), u >= 0x4F00 && u <= 0x4F19) << u;
        ASSERT_EQ(Manager::IsDigtal(uCode), u >= 0x5A00 && u <= 0x5A09) << u;
        const auto unit = static_cast<wchar_t>(u);
        ASSERT_EQ(Manager::IsEnglishWord(unit), u < 0x80 && std::isalpha(static_cast<int>(u))) << u;
        ASSERT_EQ(Manager::IsDigitalChar(unit), u < 0x80 && std::isdigit(static_cast<int>(u))) << u;
    }
}

TEST(Syllables, StandInOrderAndPadded)
{
    ASSERT_EQ(std::size(g_pyWords), 416U);
    for (size_t i = 0; i < std::size(g_pyWords); ++i)
    {
        const std::wstring strSyllable = g_pyWords[i];
        ASSERT_FALSE(strSyllable.empty() || strSyllable.size() > 6);
        ASSERT_TRUE(i == 0 || std::wstring(g_pyWords[i - 1]) < strSyllable) << i;
        ASSERT_TRUE(std::all_of(g_pyWords[i] + strSyllable.size(), std::end(g_pyWords[i]),
                                [](wchar_t unit) { return unit == 0; }));
    }
}

// Every beginning of every syllable, and everything one unit away from it.
TEST(Syllables, AreFoundByTheirBeginningsAlone)
{
    const std::wstring strUnits = L"abcdefghijklmnopqrstuvwxyzA`{0\xFFFF\x7FFFFFFF\x80000061";
    std::vector<std::wstring> vTexts = {L"zhuan", L"qianw", L"zhuangx", L"v", L""};
    for (const auto& szSyllable : g_pyWords)
    {
        const std::wstring strSyllable = szSyllable;
        for (size_t uLength = 0; uLength <= strSyllable.size(); ++uLength)
        {
            const std::wstring strBeginning = strSyllable.substr(0, uLength);
            vTexts.push_back(strBeginning);
            for (const wchar_t unit : strUnits)
            {
                vTexts.push_back(strBeginning + unit);
            }
        }
    }
    for (std::wstring& strText : vTexts)
    {
        ASSERT_EQ(Manager::IsPyWords(strText.data()), BeginsSyllable(strText))
            << testing::PrintToString(strText);
    }
    EXPECT_TRUE(BeginsSyllable(L"qianw") && !BeginsSyllable(L"zhuangx") && !BeginsSyllable(L"v"));
}
