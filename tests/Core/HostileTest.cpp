// The facade in surroundings that nobody wants: damaged files and no room. Whatever it meets, every
// operation comes back with a result code or an empty result, nothing reads or writes out of
// bounds, and as soon as the surroundings are in order again so is the index.

#include "tests/Core/FacadeFixture.h"
#include "tests/Support/ChildProcess.h"

#include <algorithm>
#include <filesystem>
#include <random>
#include <sys/resource.h>

namespace
{

namespace fs = std::filesystem;

constexpr int CONTACTS = 40;

class CHostileTest : public CFacadeTest
{
protected:
    CHostileTest()
    {
        const std::vector<std::string> vNames = {"张三", "Tom", "", "重庆", "7#", "李Lee"};
        std::vector<std::string> vAll;
        for (size_t i = 1; i <= CONTACTS; ++i)
        {
            vAll.push_back(vNames[i % vNames.size()]);
        }
        BuildNames(vAll);
    }

    // Searches of every kind, typed on.
    void SearchEverywhere()
    {
        const auto pChain = Chain(FILTER_GROUP, 1);
        for (const IME_SEARCH_TYPE eType : {IME_SEARCH_WORD, IME_SEARCH_NUM, IME_SEARCH_SPECIAL})
        {
            Set last;
            for (const char* szText : {"", "z", "zh", "zh9", "zh9张"})
            {
                Search(szText, eType, nullptr, pChain.get());
                const tag_Found found = Search(szText, eType, last);
                EXPECT_EQ(found.set != nullptr, found.iRet == 0);
                int aiCounts[27] = {};
                m_logic.GetFirstWordInfo(found.set.get(), aiCounts);
                last = found.set;
            }
        }
    }

    // In an order in which what comes early repairs nothing.
    void UseEverything()
    {
        m_logic.MemInit(false);
        SearchEverywhere();
        wchar_t szName[CONTACT_MAX_NAME + 1] = L"张三Tom 2";
        wchar_t szOut[64] = {};
        m_logic.GetLocalizer(szName, szOut);
        m_logic.OnContactTimeChanged(5, 1'700'000'000'000);
        m_logic.OnContactStarChanged(5, 1);
        long long allIds[] = {1, 2, 3, 500};
        m_logic.OnContactsTableChanged(4, allIds);
        m_logic.OnStatusUpdatesTableChanged(0, nullptr);
        m_logic.SetSortType(m_logic.OnGetSortType() == 1 ? 0 : 1);
        m_logic.OnContactsTableChanged();
        SearchEverywhere();
    }
};

TEST_F(CHostileTest, DamagedFilesHarmNobody)
{
    const std::string strRoot = m_directory.Root() + "/files";
    const auto Repair = [&]
    {
        fs::remove_all(strRoot);
        fs::create_directory(strRoot);
        m_directory.InstallPinyinTable();
        ASSERT_EQ(m_logic.MemInit(true), 0);
        ExpectFresh();
        EXPECT_EQ(Search("zs").Contacts().size(), 6U);
    };
    for (const char* szPath : {CDataPaths::ContactReg(), CDataPaths::ContactRecords(),
                               CDataPaths::PinyinMapping(), CDataPaths::PinyinSource()})
    {
        const std::string strWhole = CDataDirectory::ReadBytes(szPath);
        const size_t uSize = strWhole.size();
        std::string strRandom(uSize, '\0');
        std::generate(strRandom.begin(), strRandom.end(), std::mt19937(5));
        for (const std::string& strBytes :
             {std::string(), strWhole.substr(0, 1), strWhole.substr(0, uSize / 2 + 1),
              strWhole.substr(1), strRandom, std::string(uSize, '\x7f'),
              std::string(uSize, '\xff')})
        {
            SCOPED_TRACE(std::string(szPath) + " begins with " + strBytes.substr(0, 3));
            CDataDirectory::WriteBytes(szPath, strBytes);
            UseEverything();
            Repair();
        }
        fs::remove(szPath);
        UseEverything();
        Repair();
    }
    // Too many contacts, bytes that wrap around in 32 bits, a capacity of 2 GB.
    for (const tag_ContactReg& reg : {tag_ContactReg{-1, 0, -40},
                                      {INT32_MAX, 0, INT32_MAX},
                                      {6101805, 0, 6101805},
                                      {CONTACTS, 0, 3000000},
                                      {1041, 0, 1041},
                                      {CONTACTS, -559038737, 1040}})
    {
        SetReg(reg);
        UseEverything();
        Repair();
    }
}

// The store has to grow and cannot: the old index answers on, and the change is not forgotten.
TEST_F(CHostileTest, AFileSizeLimitKeepsTheOldIndex)
{
    const std::string strBefore = RecordsFile();
    std::vector<tag_ProviderContact> vContacts(STORE_SPARE_RECORDS + 1);
    for (size_t i = 0; i < vContacts.size(); ++i)
    {
        vContacts[i].iId = 1000 + static_cast<int>(i);
        vContacts[i].strName = "Tom";
    }
    m_provider.PutAll(vContacts);
    EXPECT_TRUE(RunInChild(
        [&]
        {
            const rlimit limit = {strBefore.size(), strBefore.size()};
            ASSERT_EQ(setrlimit(RLIMIT_FSIZE, &limit), 0);
            long long llId = 1000;
            m_logic.OnContactsTableChanged(1, &llId);
            EXPECT_EQ(m_logic.MemInit(true), -1);
            EXPECT_EQ(Search("").Contacts().size(), static_cast<size_t>(CONTACTS));
        }));
    EXPECT_EQ(RecordsFile(), strBefore);
    EXPECT_EQ(Reg(), (tag_ContactReg{CONTACTS, 0, 0})) << "asks for a rebuild";
    m_logic.OnStatusUpdatesTableChanged(0, nullptr);
    EXPECT_EQ(Reg().iTotalNum, CONTACTS + STORE_SPARE_RECORDS + 1);
    ExpectFresh();
}

} // namespace
