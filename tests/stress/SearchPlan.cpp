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

constexpr size_t MAX_FILTERS = 3;
constexpr size_t MAX_KEYS = 5;
constexpr wchar_t WORD_KEYS[] = L"zhangwlidso#张重7t";
constexpr wchar_t NUM_KEYS[] = L"23456789";

// A hash in the order of the bytes (FNV-1a).
class CHash
{
public:
    void Add(const void* pBytes, size_t uBytes)
    {
        const auto* pByte = static_cast<const unsigned char*>(pBytes);
        for (size_t i = 0; i < uBytes; ++i)
        {
            m_uHash = (m_uHash ^ pByte[i]) * 0x100000001B3U;
        }
    }
    uint64_t Value() const { return m_uHash; }

private:
    uint64_t m_uHash = 0xCBF29CE484222325U;
};

using ChainPtr = std::unique_ptr<CFilterChain>;

ChainPtr MakeChain(CLocalizerLogic& logic, const tag_SearchPlan& plan)
{
    int aiKinds[MAX_FILTERS] = {};
    QVLong32 alIds[MAX_FILTERS] = {};
    for (size_t i = 0; i < plan.vFilters.size(); ++i)
    {
        aiKinds[i] = plan.vFilters[i].first;
        alIds[i] = plan.vFilters[i].second;
    }
    CFilterChain* pChain = nullptr;
    logic.CreateFilterChain(aiKinds, alIds, static_cast<int>(plan.vFilters.size()), &pChain);
    return ChainPtr(pChain);
}

// The result sets of a plan, each needed until the next search is done.
class CResultHolder
{
public:
    explicit CResultHolder(CLocalizerLogic& logic) : m_logic(logic) {}
    ~CResultHolder() { m_logic.FreeSearchResult(m_pResult); }
    CResultHolder(const CResultHolder&) = delete;
    CResultHolder& operator=(const CResultHolder&) = delete;

    tag_LocalizerResult* Get() const { return m_pResult; }
    void Replace(tag_LocalizerResult* pResult)
    {
        m_logic.FreeSearchResult(m_pResult);
        m_pResult = pResult;
    }

private:
    CLocalizerLogic& m_logic;
    tag_LocalizerResult* m_pResult = nullptr;
};

void AddResult(const tag_LocalizerResult& result, CHash& hash, CHash& index)
{
    std::set<int32_t> setIds;
    hash.Add(&result.iResultNum, sizeof(result.iResultNum));
    for (int i = 0; i < result.iResultNum; ++i)
    {
        tag_LocalizerDetail detail = result.pDetail[i];
        if (!setIds.insert(detail.iContactID).second)
        {
            throw CFoundTwice("contact " + std::to_string(detail.iContactID) + " twice");
        }
        index.Add(&detail.iFirstWord, sizeof(detail.iFirstWord));
        detail.iFirstWord = 0;
        hash.Add(&detail, sizeof(detail));
    }
}

} // namespace

tag_SearchPlan AnyPlan(std::mt19937& random)
{
    const auto Pick = [&random](size_t uNum) { return random() % uNum; };
    constexpr int KINDS[] = {FILTER_GROUP,          FILTER_ACCOUNT, FILTER_PHONE,
                             FILTER_FAVOURITES,     FILTER_MAIL,    FILTER_GROUP_EXPAND,
                             FILTER_ACCOUNT_EXPAND, FILTER_ONLINE,  FILTER_CONTACT_ID_EXPAND};
    tag_SearchPlan plan;
    for (size_t i = Pick(2) * (1 + Pick(MAX_FILTERS)); i > 0; --i)
    {
        plan.vFilters.emplace_back(KINDS[Pick(std::size(KINDS))],
                                   static_cast<QVLong32>(1 + Pick(4)));
    }
    plan.eType = Pick(2) == 0 ? IME_SEARCH_WORD : IME_SEARCH_NUM;
    const std::wstring strKeys = plan.eType == IME_SEARCH_WORD ? WORD_KEYS : NUM_KEYS;
    std::wstring strText;
    if (Pick(3) != 0)
    {
        strText += strKeys[Pick(strKeys.size())];
    }
    plan.vTexts.push_back(strText);
    for (size_t i = Pick(MAX_KEYS); i > 0; --i)
    {
        strText += strKeys[Pick(strKeys.size())];
        plan.vTexts.push_back(strText);
    }
    return plan;
}

tag_SearchOutcome RunPlan(CLocalizerLogic& logic, const tag_SearchPlan& plan)
{
    const ChainPtr pChain = MakeChain(logic, plan);
    CResultHolder last(logic);
    tag_SearchOutcome outcome;
    CHash hash;
    CHash index;
    for (const std::wstring& strText : plan.vTexts)
    {
        std::wstring strTyped = strText;
        tag_LocalizerResult* pResult = nullptr;
        long lMask = 0;
        wchar_t szWords[CN_WORD_MAX + 1] = {};
        const bool bFirst = last.Get() == nullptr;
        const int iRet = logic.Search(last.Get(), strTyped.data(), plan.eType, pChain.get(), 0,
                                      &pResult, &lMask, szWords);
        if (iRet != 0 || pResult == nullptr)
        {
            throw std::runtime_error("a search failed with " + std::to_string(iRet));
        }
        last.Replace(pResult);
        AddResult(*pResult, hash, index);
        hash.Add(&lMask, sizeof(lMask));
        hash.Add(szWords, sizeof(szWords));
        outcome.iFound = bFirst ? pResult->iResultNum : outcome.iFound;
    }
    outcome.uHash = hash.Value();
    outcome.uIndex = index.Value();
    return outcome;
}
