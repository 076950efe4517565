// Four processes search while one changes the contacts. Which names a contact can have follows
// from its id, so every entry tells by itself whether it is right.

#include "Filter/FilterChain.h"
#include "Platform/LogSink.h"
#include "tests/Support/ChildProcess.h"
#include "tests/Support/WideText.h"
#include "tests/faults/Options.h"
#include "tests/faults/StoreCase.h"

#include <atomic>
#include <chrono>
#include <cstring>
#include <gtest/gtest.h>
#include <memory>
#include <random>
#include <set>
#include <unistd.h>

namespace
{

constexpr int CONTACTS = 2000;           // those with even ids never change
constexpr int FORMS = 3;                 // of a contact's name, far apart in name order
constexpr unsigned int MAX_PAUSE = 8000; // microseconds between two searches
constexpr unsigned int GRACE = 60;       // seconds that a reader may take longer
constexpr long long FIRST_TIME = 1'600'000'000'000;

struct tag_Board
{
    std::atomic<int> iStop;
    std::atomic<int> iSearches;
    std::atomic<int> iFound; // entries
};

std::string NameOf(int iId, int iForm)
{
    std::string strName = iForm == 1 ? "张" : std::string(1, static_cast<char>('a' + 12 * iForm));
    for (int i = iId; i > 0; i /= 10)
    {
        strName += static_cast<char>('b' + i % 10);
    }
    return strName;
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
            for (int iForm = 0; iForm < FORMS; ++iForm)
            {
                m_vKeys.push_back(LocalizerKeyOf(NameOf(iId, iForm)));
            }
            tag_ProviderContact contact;
            contact.iId = contact.iStatusId = iId;
            contact.strName = NameOf(iId, iId % FORMS);
            contact.strKey = *(Keys(iId) + iId % FORMS);
            contact.llLastTime = FIRST_TIME + iId * 7919LL % CONTACTS;
            vContacts.push_back(contact);
        }
        CProviderDatabase().PutAll(vContacts);
    }

    // The keys of the forms of a contact's name.
    const std::string* Keys(int iId) const
    {
        return m_vKeys.data() + static_cast<ptrdiff_t>(iId - 1) * FORMS;
    }

    // What is wrong with a search's result; nothing in most cases.
    std::string FaultOf(const tag_LocalizerResult& result, bool bEverybody) const
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
            const std::string* pEnd = Keys(iId) + FORMS;
            if (std::find(Keys(iId), pEnd, Narrow(result.pDetail[i].szLocalizerKey)) == pEnd)
            {
                return "contact " + std::to_string(iId) + " with another's key";
            }
            iUnchanged += iId % 2 == 0 ? 1 : 0;
        }
        return bEverybody && iUnchanged != CONTACTS / 2 ? "contacts missing" : "";
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
        CFilterChain everybody;
        std::string strFault;
        while (m_board->iStop == 0 && strFault.empty())
        {
            bRefused = false;
            const size_t uTyped = random() % std::size(TYPED);
            wchar_t szInput[8] = {};
            std::wcscpy(szInput, TYPED[uTyped]);
            tag_Answer answer;
            const IME_SEARCH_TYPE eType = uTyped < 5 ? IME_SEARCH_WORD : IME_SEARCH_NUM;
            answer.iRet = logic.Search(nullptr, szInput, eType, &everybody, 0, &answer.pResult,
                                       &answer.lMask, answer.szText);
            strFault = answer.iRet != 0 ? "result " + std::to_string(answer.iRet)
                                        : FaultOf(*answer.pResult, *szInput == 0 && !bRefused);
            m_board->iFound += answer.pResult == nullptr ? 0 : answer.pResult->iResultNum;
            logic.FreeSearchResult(answer.pResult);
            ++m_board->iSearches;
            usleep(static_cast<useconds_t>(random() % MAX_PAUSE));
        }
        return strFault;
    }

    // A change of some odd contacts, and the library told of it.
    void ChangeOnce(CProviderDatabase& provider, CLocalizerLogic& logic, std::mt19937& random)
    {
        const auto Odd = [&random] { return 1 + 2 * static_cast<int>(random() % (CONTACTS / 2)); };
        const int iId = Odd();
        const auto uKind = random() % 32;
        if (uKind < 4)
        {
            m_llNow += 1000;
            provider.SetLastTime(iId, m_llNow);
            logic.OnContactTimeChanged(iId, m_llNow);
        }
        else if (uKind == 4)
        {
            logic.SetSortType(1 - logic.OnGetSortType());
            logic.OnContactsTableChanged();
        }
        else
        {
            long long allIds[5];
            provider.Execute("begin");
            for (long long& llId : allIds)
            {
                const int iChanged = Odd();
                const auto iForm = static_cast<int>(random() % FORMS);
                provider.SetName(iChanged, NameOf(iChanged, iForm), Keys(iChanged)[iForm]);
                provider.SetVisible(iChanged, random() % 3 != 0);
                llId = iChanged;
            }
            provider.Execute("commit");
            logic.OnContactsTableChanged(5, allIds);
        }
    }

    CDataDirectory m_directory;
    CShared<tag_Board> m_board{};
    std::vector<std::string> m_vKeys;
    long long m_llNow = FIRST_TIME + 10'000'000;
};

TEST_F(CReaders, NeverSeeAnotherContact)
{
    ASSERT_EQ(CLocalizerLogic().MemInit(true), 0);
    std::vector<std::unique_ptr<CChild>> vReaders;
    for (unsigned int i = 0; i < 4; ++i)
    {
        vReaders.push_back(std::make_unique<CChild>(
            [this, i] { return ReadUntilStopped(g_options.uSeed * 10 + i); },
            g_options.uSeconds + GRACE));
    }
    int iChanges = 0;
    {
        CProviderDatabase provider;
        CLocalizerLogic logic;
        std::mt19937 random(g_options.uSeed);
        const auto end =
            std::chrono::steady_clock::now() + std::chrono::seconds(g_options.uSeconds);
        for (; std::chrono::steady_clock::now() < end || m_board->iSearches < 4; ++iChanges)
        {
            ChangeOnce(provider, logic, random);
        }
        logic.OnStatusUpdatesTableChanged(0, nullptr);
    }
    m_board->iStop = 1;
    for (const auto& pReader : vReaders)
    {
        EXPECT_EQ(pReader->Text(), "");
    }
    const tag_StoreImage store = ReadStore();
    EXPECT_EQ(DifferenceOf(store, FreshBuild(m_directory.Root(), store.reg.iSortType)), "");
    std::printf("%d changes, %d searches, %d entries\n", iChanges, m_board->iSearches.load(),
                m_board->iFound.load());
}

} // namespace
