// Four processes search while one changes the contacts. Which keys a contact can have follows from
// its id, so every entry tells by itself whether it is right.

#include "tests/Support/ChildProcess.h"
#include "tests/Support/LogCapture.h"
#include "tests/faults/StoreCase.h"
#include "tools/Utf8Text.h"

#include <chrono>
#include <gtest/gtest.h>
#include <list>
#include <random>
#include <set>
#include <unistd.h>

namespace
{

using Clock = std::chrono::steady_clock;

constexpr int CONTACTS = 2000;                     // those with even ids never change
constexpr const char* STARTS[] = {"a", "张", "y"}; // of a contact's names, its id behind them
constexpr unsigned int MAX_PAUSE = 8000;           // microseconds between two searches
constexpr unsigned int GRACE = 60;                 // seconds that a reader may take longer

class CReaders : public testing::Test
{
protected:
    CReaders()
    {
        m_directory.InstallPinyinTable();
        CLocalizerLogic().MemInit(true);
        std::vector<tag_DatabaseContact> vContacts;
        for (int iId = 1; iId <= CONTACTS; ++iId)
        {
            for (int i = 0; i < 3; ++i) // the last of them stays
            {
                const std::string strName = STARTS[(iId + i) % 3] + std::to_string(iId);
                vContacts.push_back({iId, strName, LocalizerKeyOf(strName)});
                m_mapIds[WideText(vContacts.back().strKey)] = iId;
            }
        }
        CProviderDatabase().PutAll(vContacts);
    }

    // Nobody is there twice or with another's key, and of everybody nobody lacks who never changes.
    void Examine(const tag_LocalizerResult& result, bool bEverybody) const
    {
        std::set<int> setSeen;
        int iUnchanged = 0;
        for (int i = 0; i < result.iResultNum; ++i)
        {
            const int iId = result.pDetail[i].iContactID;
            const auto owner = m_mapIds.find(result.pDetail[i].szLocalizerKey);
            EXPECT_TRUE(owner != m_mapIds.end() && owner->second == iId) << iId;
            EXPECT_TRUE(setSeen.insert(iId).second) << iId;
            iUnchanged += iId % 2 == 0 ? 1 : 0;
        }
        EXPECT_TRUE(!bEverybody || iUnchanged == CONTACTS / 2);
    }

    void Read(unsigned int uSeed) const
    {
        constexpr const wchar_t* TYPED[] = {L"", L"", L"a1", L"zh", L"y12", L"2", L"94"};
        CLogCapture log;
        std::mt19937 random(uSeed);
        CLocalizerLogic logic;
        const auto end = Clock::now() + std::chrono::seconds(g_uSeconds);
        do
        {
            log.Clear();
            const size_t uTyped = random() % std::size(TYPED);
            tag_Answer answer;
            Search(logic, answer, TYPED[uTyped], uTyped < 5 ? IME_SEARCH_WORD : IME_SEARCH_NUM);
            const bool bRefused = !log.Texts(ERROR_LINE).empty(); // the lock
            ASSERT_EQ(answer.iRet, 0);
            Examine(*answer.pResult, uTyped < 2 && !bRefused);
            logic.FreeSearchResult(answer.pResult);
            usleep(static_cast<useconds_t>(random() % MAX_PAUSE));
        } while (Clock::now() < end && !HasFailure());
    }

    // A change of some odd contacts, and the library told of it.
    static void ChangeOnce(CProviderDatabase& provider, CLocalizerLogic& logic,
                           std::mt19937& random)
    {
        long long allIds[5];
        std::generate(std::begin(allIds), std::end(allIds),
                      [&random] { return 1 + 2 * static_cast<int>(random() % (CONTACTS / 2)); });
        provider.Execute("begin");
        for (const long long llId : allIds)
        {
            const auto iId = static_cast<int>(llId);
            const std::string strName = STARTS[random() % 3] + std::to_string(iId);
            provider.SetName(iId, strName, LocalizerKeyOf(strName));
            provider.SetVisible(iId, random() % 3 != 0);
        }
        provider.Execute("commit");
        logic.OnContactsTableChanged(5, allIds);
    }

    CDataDirectory m_directory;
    std::map<std::wstring, int> m_mapIds; // by key
};

TEST_F(CReaders, NeverSeeAnotherContact)
{
    ASSERT_EQ(CLocalizerLogic().MemInit(true), 0);
    std::list<CChild> readers;
    for (unsigned int i = 0; i < 4; ++i)
    {
        readers.emplace_back([this, i] { Read(g_uSeed * 10 + i); }, g_uSeconds + GRACE);
    }
    {
        CProviderDatabase provider;
        CLocalizerLogic logic;
        std::mt19937 random(g_uSeed);
        const auto end = Clock::now() + std::chrono::seconds(g_uSeconds);
        while (Clock::now() < end)
        {
            ChangeOnce(provider, logic, random);
        }
    }
    for (CChild& reader : readers)
    {
        EXPECT_TRUE(reader.Passes());
    }
    EXPECT_EQ(DifferenceOf(ReadStore(), FreshBuild(m_directory.Root(), STORE_ORDER_NAME)), "");
}

} // namespace
