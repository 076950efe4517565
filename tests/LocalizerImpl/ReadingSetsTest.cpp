// The table of reading sets: what it holds, and that the kept one is never an old one.

#include "tests/LocalizerImpl/LocalizerFixture.h"

#include "Common/DataPaths.h"
#include "Common/SystemTime.h"
#include "LocalizerImpl/PinyinTable.h"
#include "LocalizerImpl/ReadingSets.h"

#include <map>

namespace
{

class ReadingSets : public LocalizerFixture
{
protected:
    static CReadingSets::Ptr Open()
    {
        const tag_FileStamp stamp = ReadFileStamp(CDataPaths::PinyinMapping());
        const CPinyinTable table;
        return CReadingSets::Of(table.Records(), stamp);
    }

    // Another reading for the first character, through the shipped table.
    void Install(const char* szReading) const
    {
        std::string strTable = CDataDirectory::ReadBytes(m_data.File("pyfile.bin"));
        std::strcpy(&strTable[offsetof(PYOFWORDS, szPinyin)], szReading);
        CDataDirectory::WriteBytes(m_data.File("pyfile.bin"), strTable);
        ASSERT_EQ(CQVLocalizerManager::InitMapFile(), 0);
    }

    // Waits until the table counts as written long ago.
    static void Settle()
    {
        while (!ReadFileStamp(CDataPaths::PinyinMapping()).bSettled)
        {
            Sleep(50);
        }
    }

    static std::string FirstReading(const CReadingSets::Ptr& sets)
    {
        return sets->RecordOf(LOC_HANZI_BASE).szPinyin[0];
    }
};

} // namespace

TEST_F(ReadingSets, HoldEveryRecordOnce)
{
    const CReadingSets::Ptr sets = Open();
    ASSERT_NE(sets, nullptr);
    std::map<std::string, int> setOfReadings;
    for (int i = 0; i < PY_WORD_COUNT; ++i)
    {
        const wchar_t code = LOC_HANZI_BASE + static_cast<wchar_t>(i);
        const PYOFWORDS record = sets->RecordOf(code);
        ASSERT_EQ(std::memcmp(&record, m_pMap + i, sizeof(record)), 0) << i;
        const std::string strReadings(m_pMap[i].szPinyin[0],
                                      sizeof(record) - sizeof(record.szWord));
        const auto place = setOfReadings.emplace(strReadings, sets->KeyOf(code)).first;
        ASSERT_EQ(place->second, sets->KeyOf(code)) << i;
    }
    EXPECT_EQ(static_cast<int>(setOfReadings.size()), sets->Count());
}

TEST_F(ReadingSets, AreKeptWhileTheTableStaysTheSame)
{
    Settle();
    const CReadingSets::Ptr first = Open();
    const std::string strFirst = FirstReading(first);
    EXPECT_EQ(Open().get(), first.get());
    Install("aaa");
    EXPECT_EQ(FirstReading(Open()), "aaa");
    EXPECT_EQ(FirstReading(first), strFirst) << "the older one is still in use";
}

TEST_F(ReadingSets, OfATableWrittenJustNowAreNotKept)
{
    for (const char* szReading : {"aaa", "bbb", "ccc"})
    {
        Install(szReading);
        EXPECT_EQ(FirstReading(Open()), szReading);
    }
}
