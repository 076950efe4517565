// Four processes search while one changes the contacts. Which names a contact can have follows
// from its id, so every entry tells by itself whether it is right.

#include "Platform/LogSink.h"
#include "tests/Support/ChildProcess.h"
#include "tests/Support/WideText.h"
#include "tests/faults/StoreCase.h"

#include <atomic>
#include <chrono>
#include <gtest/gtest.h>
#include <iostream>
#include <list>
#include <random>
#include <set>
#include <unistd.h>

namespace
{

using Clock = std::chrono::steady_clock;

constexpr int CONTACTS = 2000;                 // those with even ids never change
constexpr wchar_t FORMS[] = {'a', L'张', 'y'}; // first characters of a contact's names
constexpr unsigned int MAX_PAUSE = 8000;       // microseconds between two searches
constexpr unsigned int GRACE = 60;             // seconds that a reader may take longer
constexpr long long FIRST_TIME = 1'600'000'000'000;

struct tag_Board
{
    std::atomic<int> iStop;
    std::atomic<int> iSearches;
};

std::string NameOf(int iId, wchar_t form)
{
    std::string strName = Narrow({form});
    for (int i = iId; i > 0; i /= 10)
    {
        strName += static_cast<char>('b' + i % 10);
    }
    return strName;
}

// The id that is in the name of whoever has the key.
int IdOf(const wchar_t* szKey)
{
    int iId = 0;
    for (size_t i = std::wcslen(szKey); i > 1; --i)
    {
        iId = iId * 10 + static_cast<int>(szKey[i - 1] - LOC_ALPHA_BASE) - 1; // 'b' for 0
    }
    return iId;
}

// What is wrong with a search's result; nothing in most cases.
std::string FaultOf(const tag_LocalizerResult& result, bool bEverybody)
{
    std::set<int> setSeen;
    int iUnchanged = 0;
    for (int i = 0; i < result.iResultNum; ++i)
    {
        const int iId = result.pDetail[i].iContactID;
        if (iId < 1 || iId > CONTACTS || !setSeen.insert(iId).second)
        {
            return "contact " + std::to_string(iId) + " unknown or twice";
        }
        if (IdOf(result.pDetail[i].szLocalizerKey) != iId)
        {
            return "contact " + std::to_string(iId) + " with another's key";
        }
        iUnchanged += iId % 2 == 0 ? 1 : 0;
    }
    return bEverybody && iUnchanged != CONTACTS / 2 ? "contacts missing" : "";
}

class CReaders : public testing::Test
{
protected:
    CReaders()
    {
        m_directory.InstallPinyinTable();
        CLocalizerLogic().MemInit(true);
        std::vector<tag_ProviderContact> vContacts;
        for (int iId = 1; iId <= CONTACTS; ++iId)
        {
            tag_ProviderContact contact;
            contact.iId = contact.iStatusId = iId;
            contact.strName = NameOf(iId, FORMS[iId % 3]);
            contact.strKey = LocalizerKeyOf(contact.strName);
            contact.llLastTime = FIRST_TIME + iId * 7919LL % CONTACTS;
            vContacts.push_back(contact);
        }
        CProviderDatabase().PutAll(vContacts);
    }

    std::string ReadUntilStopped(unsigned int uSeed)
    {
        constexpr const wchar_t* TYPED[] = {L"", L"", L"b", L"zh", L"ycd", L"2", L"93"};
        bool bRefused = false;
        CLogSink::Set(
            [](void* pContext, int, const char*, const char* szText) {
                *static_cast<bool*>(pContext) |=
                    std::strstr(szText, "lock false return") != nullptr;
            },
            &bRefused);
        std::mt19937 random(uSeed);
        CLocalizerLogic logic;
        std::string strFault;
        while (m_board.iStop == 0 && strFault.empty())
        {
            bRefused = false;
            const size_t uTyped = random() % std::size(TYPED);
            tag_Answer answer;
            Search(logic, answer, TYPED[uTyped], uTyped < 5 ? IME_SEARCH_WORD : IME_SEARCH_NUM);
            strFault = answer.iRet != 0 ? "result " + std::to_string(answer.iRet)
                                        : FaultOf(*answer.pResult, uTyped < 2 && !bRefused);
            logic.FreeSearchResult(answer.pResult);
            ++m_board.iSearches;
            usleep(static_cast<useconds_t>(random() % MAX_PAUSE));
        }
        return strFault;
    }

    // A change of some odd contacts, and the library told of it.
    void ChangeOnce(CProviderDatabase& provider, CLocalizerLogic& logic, std::mt19937& random)
    {
        long long allIds[5];
        std::generate(std::begin(allIds), std::end(allIds),
                      [&random] { return 1 + 2 * static_cast<int>(random() % (CONTACTS / 2)); });
        const auto uKind = random() % 32;
        if (uKind < 4)
        {
            m_llNow += 1000;
            provider.SetLastTime(static_cast<int>(allIds[0]), m_llNow);
            logic.OnContactTimeChanged(static_cast<long>(allIds[0]), m_llNow);
        }
        else if (uKind == 4)
        {
            logic.SetSortType(1 - logic.OnGetSortType());
            logic.OnContactsTableChanged();
        }
        else
        {
            provider.Execute("begin");
            for (const long long llId : allIds)
            {
                const auto iId = static_cast<int>(llId);
                const std::string strName = NameOf(iId, FORMS[random() % 3]);
                provider.SetName(iId, strName, LocalizerKeyOf(strName));
                provider.SetVisible(iId, random() % 3 != 0);
            }
            provider.Execute("commit");
            logic.OnContactsTableChanged(5, allIds);
        }
    }

    CDataDirectory m_directory;
    tag_Board& m_board = NewShared<tag_Board>();
    long long m_llNow = FIRST_TIME + 10'000'000;
};

TEST_F(CReaders, NeverSeeAnotherContact)
{
    ASSERT_EQ(CLocalizerLogic().MemInit(true), 0);
    std::list<CChild> readers;
    for (unsigned int i = 0; i < 4; ++i)
    {
        readers.emplace_back([this, i] { return ReadUntilStopped(g_uSeed * 10 + i); },
                             g_uSeconds + GRACE);
    }
    int iChanges = 0;
    {
        CProviderDatabase provider;
        CLocalizerLogic logic;
        std::mt19937 random(g_uSeed);
        const auto end = Clock::now() + std::chrono::seconds(g_uSeconds);
        for (; Clock::now() < end || m_board.iSearches < 4; ++iChanges)
        {
            ChangeOnce(provider, logic, random);
        }
        logic.OnStatusUpdatesTableChanged(0, nullptr);
    }
    m_board.iStop = 1;
    for (CChild& reader : readers)
    {
        EXPECT_EQ(reader.Text(), "");
    }
    const tag_StoreImage store = ReadStore();
    EXPECT_EQ(DifferenceOf(store, FreshBuild(m_directory.Root(), store.reg.iSortType)), "");
    std::cout << iChanges << " changes, " << m_board.iSearches << " searches\n";
}

} // namespace
