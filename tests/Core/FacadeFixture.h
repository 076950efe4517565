#ifndef QV_TESTS_CORE_FACADEFIXTURE_H
#define QV_TESTS_CORE_FACADEFIXTURE_H

#include "Core/LocalizerLogic.h"
#include "Core/Records/LocalizerCodes.h"
#include "Filter/FilterChain.h"
#include "LocalizerImpl/QVLocalizerManager.h"
#include "tests/Support/DataDirectory.h"
#include "tests/Support/LogCapture.h"
#include "tests/Support/ProviderDatabase.h"
#include "tests/Support/StoreImage.h"
#include "tools/Utf8Text.h"

#include <gtest/gtest.h>
#include <memory>
#include <string>
#include <vector>

using Ids = std::vector<int>;

// A provider database and a facade in a data directory of their own, with the pinyin table in
// place but no index. Every result set that a search hands out is released with the test.
class CFacadeTest : public testing::Test
{
protected:
    using Set = std::shared_ptr<tag_LocalizerResult>;

    // One search as its caller sees it.
    struct tag_Found
    {
        int iRet = 0;
        Set set{};               // null when nothing was handed out
        long lMask = MASK_UNSET; // as DoSearch left it
        std::wstring strInput{}; // the caller's buffer afterwards
        std::string strWords{};  // candidate characters in UTF-8

        template <typename Field>
        std::vector<Field> Column(Field tag_LocalizerDetail::*pField) const
        {
            std::vector<Field> vFields;
            for (int i = 0; set != nullptr && i < set->iResultNum; ++i)
            {
                vFields.push_back(set->pDetail[i].*pField);
            }
            return vFields;
        }
        Ids Contacts() const { return Column(&tag_LocalizerDetail::iContactID); }
    };

    static constexpr long MASK_UNSET = -77;
    static constexpr long long FIRST_TIME = 1'600'000'000'000;

    CFacadeTest() { m_directory.InstallPinyinTable(); }

    // Last contacted in the order of their ids, as far as these are below 20.
    static tag_DatabaseContact Contact(int iId, const std::string& strName)
    {
        tag_DatabaseContact contact;
        contact.llID = iId;
        contact.strName = strName;
        contact.llLastTimeContacted = FIRST_TIME + iId % 20 * 1000LL;
        contact.llStatusUpdateID = 1000 + iId;
        return contact;
    }

    // Stores contacts with their keys, without building the index.
    void Store(std::vector<tag_DatabaseContact> vContacts)
    {
        EXPECT_EQ(CQVLocalizerManager::InitMapFile(), 0);
        for (tag_DatabaseContact& contact : vContacts)
        {
            contact.strKey = LocalizerKeyOf(contact.strName);
        }
        m_provider.PutAll(vContacts);
    }

    // Stores contacts 1, 2, ... with these names and builds the index.
    void BuildNames(const std::vector<std::string>& vNames)
    {
        std::vector<tag_DatabaseContact> vContacts(vNames.size());
        std::transform(vNames.begin(), vNames.end(), vContacts.begin(),
                       [iId = 0](const std::string& strName) mutable
                       { return Contact(++iId, strName); });
        Store(vContacts);
        ASSERT_EQ(m_logic.MemInit(true), 0);
    }

    std::unique_ptr<CFilterChain> Chain(int iKind, QVLong32 lId)
    {
        CFilterChain* pChain = nullptr;
        EXPECT_EQ(m_logic.CreateFilterChain(&iKind, &lId, 1, &pChain), 0);
        return std::unique_ptr<CFilterChain>(pChain);
    }

    tag_Found Search(const std::string& strInput, IME_SEARCH_TYPE eType = IME_SEARCH_WORD,
                     const Set& pLast = nullptr, CFilterChain* pChain = nullptr)
    {
        tag_Found found;
        found.strInput = WideText(strInput);
        wchar_t szWords[CN_WORD_MAX + 1] = {};
        tag_LocalizerResult* pResult = nullptr;
        found.iRet = m_logic.Search(pLast.get(), found.strInput.data(), eType,
                                    pChain != nullptr ? pChain : &m_everybody, 0, &pResult,
                                    &found.lMask, szWords);
        if (pResult != nullptr)
        {
            found.set = Set(pResult, [this](tag_LocalizerResult* pSet)
                            { EXPECT_EQ(m_logic.FreeSearchResult(pSet), 0); });
        }
        EXPECT_EQ(szWords[CN_WORD_MAX], 0) << "more than the caller has room for";
        found.strWords = Utf8Text(szWords);
        return found;
    }

    // The store is whole and the one that a build from the database makes.
    void ExpectFresh()
    {
        const tag_StoreImage store = ReadStore();
        EXPECT_FALSE(IsMarked(store.reg));
        EXPECT_EQ(DifferenceOf(store, FreshBuild(m_directory.Root(), store.reg.iSortType)), "");
    }

    CDataDirectory m_directory;
    CProviderDatabase m_provider;
    CLogCapture m_log;
    CFilterChain m_everybody;
    CLocalizerLogic m_logic;
};

#endif
