#include "tests/stress/SearchPlan.h"

#include "Core/LocalizerLogic.h"
#include "Filter/Filter.h"
#include "Filter/FilterChain.h"
#include "LocalizerImpl/QVLocalizerManager.h"

#include <iterator>
#include <memory>
#include <set>
#include <stdexcept>

namespace
{

constexpr size_t MAX_KEYS = 5;
constexpr wchar_t WORD_KEYS[] = L"zhangwlidso#张重7t";
constexpr wchar_t NUM_KEYS[] = L"23456789";

// A hash in the order of the bytes (FNV-1a).
struct tag_Hash
{
    void Add(const void* pBytes, size_t uBytes)
    {
        const auto* pByte = static_cast<const unsigned char*>(pBytes);
        for (size_t i = 0; i < uBytes; ++i)
        {
            m_uHash = (m_uHash ^ pByte[i]) * 0x100000001B3U;
        }
    }
    uint64_t m_uHash = 0xCBF29CE484222325U;
};

// Returns how many contacts the result holds more than once.
int AddResult(const tag_LocalizerResult& result, tag_Hash& hash, tag_Hash& index)
{
    std::set<int32_t> setIds;
    hash.Add(&result.iResultNum, sizeof(result.iResultNum));
    for (int i = 0; i < result.iResultNum; ++i)
    {
        tag_LocalizerDetail detail = result.pDetail[i];
        setIds.insert(detail.iContactID);
        index.Add(&detail.iFirstWord, sizeof(detail.iFirstWord));
        detail.iFirstWord = 0;
        hash.Add(&detail, sizeof(detail));
    }
    return result.iResultNum - static_cast<int>(setIds.size());
}

} // namespace

tag_SearchPlan AnyPlan(std::mt19937& random)
{
    const auto Pick = [&random](size_t uNum) { return random() % uNum; };
    constexpr int KINDS[] = {FILTER_GROUP,          FILTER_ACCOUNT, FILTER_PHONE,
                             FILTER_FAVOURITES,     FILTER_MAIL,    FILTER_GROUP_EXPAND,
                             FILTER_ACCOUNT_EXPAND, FILTER_ONLINE,  FILTER_CONTACT_ID_EXPAND};
    tag_SearchPlan plan;
    plan.iFilters = static_cast<int>(Pick(2) * (1 + Pick(tag_SearchPlan::MAX_FILTERS)));
    for (int i = 0; i < plan.iFilters; ++i)
    {
        plan.aiKinds[i] = KINDS[Pick(std::size(KINDS))];
        plan.alIds[i] = static_cast<QVLong32>(1 + Pick(4));
    }
    plan.eType = Pick(2) == 0 ? IME_SEARCH_WORD : IME_SEARCH_NUM;
    const std::wstring strKeys = plan.eType == IME_SEARCH_WORD ? WORD_KEYS : NUM_KEYS;
    std::wstring strText(Pick(3) == 0 ? 0 : 1, strKeys[Pick(strKeys.size())]);
    plan.vTexts.push_back(strText);
    for (size_t i = Pick(MAX_KEYS); i > 0; --i)
    {
        strText += strKeys[Pick(strKeys.size())];
        plan.vTexts.push_back(strText);
    }
    return plan;
}

tag_SearchOutcome RunPlan(CLocalizerLogic& logic, tag_SearchPlan plan)
{
    CFilterChain* pChain = nullptr;
    logic.CreateFilterChain(plan.aiKinds, plan.alIds, plan.iFilters, &pChain);
    const std::unique_ptr<CFilterChain> chain(pChain);
    // Each result is needed until the next search is done.
    std::shared_ptr<tag_LocalizerResult> last;
    tag_SearchOutcome outcome;
    tag_Hash hash;
    tag_Hash index;
    for (std::wstring& strTyped : plan.vTexts)
    {
        tag_LocalizerResult* pResult = nullptr;
        long lMask = 0;
        wchar_t szWords[CN_WORD_MAX + 1] = {};
        const int iRet = logic.Search(last.get(), strTyped.data(), plan.eType, pChain, 0, &pResult,
                                      &lMask, szWords);
        if (iRet != 0 || pResult == nullptr)
        {
            throw std::runtime_error("a search failed with " + std::to_string(iRet));
        }
        outcome.iFound = last == nullptr ? pResult->iResultNum : outcome.iFound;
        last.reset(pResult, [&logic](auto* pSet) { logic.FreeSearchResult(pSet); });
        outcome.iTwice += AddResult(*pResult, hash, index);
        hash.Add(&lMask, sizeof(lMask));
        hash.Add(szWords, sizeof(szWords));
    }
    outcome.uHash = hash.m_uHash;
    outcome.uIndex = index.m_uHash;
    return outcome;
}
