#ifndef QV_TESTS_CORE_FACADEFIXTURE_H
#define QV_TESTS_CORE_FACADEFIXTURE_H

#include "Common/DataPaths.h"
#include "Common/Utf8.h"
#include "Core/LocalizerCodes.h"
#include "Core/LocalizerLogic.h"
#include "Filter/FilterChain.h"
#include "LocalizerImpl/QVLocalizerManager.h"
#include "tests/Support/DataDirectory.h"
#include "tests/Support/LogCapture.h"
#include "tests/Support/ProviderDatabase.h"

#include <cstring>
#include <gtest/gtest.h>
#include <memory>
#include <ostream>
#include <string>
#include <utility>
#include <vector>

constexpr int DEBUG_LINE = 3;
constexpr int ERROR_LINE = 6;

using Ids = std::vector<int>;
using Records = std::vector<tag_ContactsStruct>;

inline bool operator==(const tag_ContactReg& left, const tag_ContactReg& right)
{
    return std::memcmp(&left, &right, sizeof(left)) == 0;
}
inline std::ostream& operator<<(std::ostream& stream, const tag_ContactReg& reg)
{
    return stream << '{' << reg.iTotalNum << ", " << reg.iSortType << ", " << reg.iMemSize << '}';
}

inline std::wstring Wide(const std::string& strUtf8)
{
    std::wstring strWide(strUtf8.size(), L'\0');
    const int iUnits =
        Utf82Unicode(strUtf8.c_str(), strWide.data(), static_cast<int>(strUtf8.size()) - 1);
    strWide.resize(static_cast<size_t>(std::max(iUnits, 0)));
    return strWide;
}

inline std::string Narrow(const std::wstring& strWide)
{
    std::string strUtf8(strWide.size() * 3, '\0');
    strUtf8.resize(static_cast<size_t>(
        Unicode2Utf8(strWide.c_str(), strUtf8.data(), static_cast<int>(strWide.size()) - 1)));
    return strUtf8;
}

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
        size_t uWordUnits = 0;   // how many of them

        Ids Contacts() const
        {
            Ids vIds;
            for (int i = 0; set != nullptr && i < set->iResultNum; ++i)
            {
                vIds.push_back(set->pDetail[i].iContactID);
            }
            return vIds;
        }
        const tag_LocalizerDetail& Entry(int i) const { return set->pDetail[i]; }
    };

    static constexpr long MASK_UNSET = -77;

    CFacadeTest()
    {
        m_directory.InstallPinyinTable();
        m_log.Clear();
    }

    // Fills the key of the contact the way the provider does, through a mapping handle.
    void FillKey(tag_ProviderContact* pContact)
    {
        if (!CDataDirectory::Exists(CDataPaths::PinyinMapping()))
        {
            ASSERT_EQ(CQVLocalizerManager::InitMapFile(), 0);
        }
        const long hMap = m_logic.CreatePinYinFileMapping();
        ASSERT_GT(hMap, 0);
        std::wstring strName = Wide(pContact->strName);
        wchar_t szCodes[CONTACT_MAX_KEY + 1] = {};
        EXPECT_EQ(m_logic.GetLocalizerString(hMap, strName.data(), szCodes), 0);
        EXPECT_EQ(m_logic.ReleasePinYinFileMapping(hMap), 0);
        pContact->strKey = Narrow(szCodes);
    }

    // Stores contacts with their keys, without building the index.
    void Store(std::vector<tag_ProviderContact> vContacts)
    {
        for (tag_ProviderContact& contact : vContacts)
        {
            FillKey(&contact);
        }
        m_provider.PutAll(vContacts);
    }

    // Stores contacts 1, 2, ... with these names and builds the index.
    void BuildNames(const std::vector<std::string>& vNames)
    {
        std::vector<tag_ProviderContact> vContacts(vNames.size());
        for (size_t i = 0; i < vNames.size(); ++i)
        {
            vContacts[i].iId = static_cast<int>(i) + 1;
            vContacts[i].strName = vNames[i];
        }
        Store(vContacts);
        ASSERT_EQ(m_logic.MemInit(true), 0);
        m_log.Clear();
    }

    // A chain of filters from pairs of kind and id.
    std::unique_ptr<CFilterChain> Chain(const std::vector<std::pair<int, QVLong32>>& vFilters)
    {
        std::vector<int> vKinds(vFilters.size() + 1); // never empty: data() is not null
        std::vector<QVLong32> vFilterIds(vFilters.size() + 1);
        for (size_t i = 0; i < vFilters.size(); ++i)
        {
            vKinds[i] = vFilters[i].first;
            vFilterIds[i] = vFilters[i].second;
        }
        CFilterChain* pChain = nullptr;
        EXPECT_EQ(m_logic.CreateFilterChain(vKinds.data(), vFilterIds.data(),
                                            static_cast<int>(vFilters.size()), &pChain),
                  0);
        return std::unique_ptr<CFilterChain>(pChain);
    }

    tag_Found Search(const std::string& strInput, IME_SEARCH_TYPE eType = IME_SEARCH_WORD,
                     const Set& pLast = nullptr, CFilterChain* pChain = nullptr)
    {
        return SearchWide(Wide(strInput), eType, pLast, pChain);
    }

    tag_Found SearchWide(const std::wstring& strInput, IME_SEARCH_TYPE eType = IME_SEARCH_WORD,
                         const Set& pLast = nullptr, CFilterChain* pChain = nullptr)
    {
        tag_Found found;
        found.strInput = strInput;
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
        found.uWordUnits = std::wcslen(szWords);
        found.strWords = Narrow(szWords);
        return found;
    }

    static std::string RecordsFile()
    {
        return CDataDirectory::ReadBytes(CDataPaths::ContactRecords());
    }
    // The first iNum records of the file.
    static Records StoredRecords(int iNum)
    {
        Records vRecords(static_cast<size_t>(iNum));
        const std::string strBytes = RecordsFile();
        const size_t uBytes = vRecords.size() * sizeof(tag_ContactsStruct);
        EXPECT_GE(strBytes.size(), uBytes);
        std::memcpy(static_cast<void*>(vRecords.data()), strBytes.data(),
                    std::min(strBytes.size(), uBytes));
        return vRecords;
    }
    static tag_ContactReg Reg()
    {
        const std::string strBytes = CDataDirectory::ReadBytes(CDataPaths::ContactReg());
        tag_ContactReg reg = {-77, -77, -77};
        EXPECT_EQ(strBytes.size(), sizeof(reg));
        std::memcpy(&reg, strBytes.data(), std::min(sizeof(reg), strBytes.size()));
        return reg;
    }

    CDataDirectory m_directory;
    CProviderDatabase m_provider;
    CLogCapture m_log;
    CFilterChain m_everybody;
    CLocalizerLogic m_logic;
};

#endif
