// Building the index: what it says and what it writes; and the log of all operations.

#include "tests/Core/FacadeFixture.h"
#include "tests/Support/ChildProcess.h"

#include <filesystem>
#include <regex>

namespace
{

class CMemInitTest : public CFacadeTest
{
protected:
    // Two contacts whose order differs by id and by name.
    void StoreTwo()
    {
        Store({{6}, {9, "張三", "", "", "", 0, 0, 70}});
        m_provider.SetOnline(70, true);
    }
};

TEST_F(CMemInitTest, ReloadsWhenAFileIsMissingOrEmpty)
{
    EXPECT_EQ(m_logic.MemInit(false), 0) << "no contacts";
    EXPECT_EQ(Reg(), (tag_ContactReg{0, 0, STORE_SPARE_RECORDS}));
    EXPECT_EQ(Search("").Contacts(), Ids{});
    StoreTwo();
    const auto ExpectBuilt = [this]
    {
        EXPECT_EQ(IsNeedReload(), 1);
        EXPECT_EQ(m_logic.MemInit(false), 0);
        ExpectFresh();
    };
    for (const char* szPath : {CDataPaths::PinyinMapping(), CDataPaths::ContactReg()})
    {
        std::filesystem::resize_file(szPath, 0);
        ExpectBuilt();
        std::filesystem::remove(szPath);
        ExpectBuilt();
    }
    std::filesystem::remove(CDataPaths::ContactReg());
    EXPECT_TRUE(CChild([] { EXPECT_EQ(CLocalizerLogic().MemInit(false), 0); }).Passes());
    m_provider.Remove(9); // the other process's index is there: nothing is read
    EXPECT_EQ(m_logic.MemInit(false), 0);
    EXPECT_EQ(Search("").Contacts(), (Ids{9, 6}));
}

// Every line, as log.txt tells them: without the milliseconds, which differ from run to run.
TEST_F(CMemInitTest, TellsEachStepInOrder)
{
    StoreTwo();
    ASSERT_EQ(m_logic.MemInit(true), 0);
    m_log.Clear();
    m_logic.MemInit(true);
    const tag_Found all = Search("");
    Search("z", IME_SEARCH_WORD, nullptr, Chain(FILTER_GROUP, 99).get());
    Search("z", IME_SEARCH_WORD, all.set);
    long long allIds[] = {9};
    m_logic.OnContactsTableChanged(1, allIds);
    m_logic.OnContactsTableChanged(1, nullptr);
    m_logic.OnContactsTableChanged(0, allIds);
    m_logic.OnStatusUpdatesTableChanged(0, nullptr);
    m_logic.OnContactTimeChanged(999, 1);
    m_logic.OnContactStarChanged(999, 1);
    m_logic.OnContactsTableChanged();
    m_provider.Execute("drop table status_updates");
    EXPECT_EQ(CLocalizerLogic().MemInit(true), 0) << "without the online state";
    const std::regex milliseconds("(time =|EXIT takes) [0-9]+");
    EXPECT_EQ(std::regex_replace(m_log.Take(), milliseconds, "$1 ms"),
              CDataDirectory::ReadBytes(QV_TEST_DATA "/Core/log.txt"));
}

} // namespace
