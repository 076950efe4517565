#include "tools/SearchSession.h"

#include "tools/Utf8Text.h"

#include <utility>

namespace
{

// Sections that the library counts: the index characters, then all other contacts.
constexpr int LETTER_SECTIONS = 27;
constexpr int TIME_SECTIONS = 6;

std::string SectionLabel(int iSection, bool bTimeOrder)
{
    const int iLast = (bTimeOrder ? TIME_SECTIONS : LETTER_SECTIONS) - 1;
    if (iSection == iLast)
    {
        return bTimeOrder ? "-" : "#";
    }
    return std::string(1, static_cast<char>((bTimeOrder ? '1' : 'A') + iSection));
}

} // namespace

CSearchSession::CSearchSession(IME_SEARCH_TYPE eType, CFilterChain& chain, bool bNarrow,
                               ContactNameLookup fnNames)
    : m_search(eType, chain), m_bNarrow(bNarrow), m_fnNames(std::move(fnNames))
{
}

tag_SearchStep CSearchSession::Search(const std::wstring& wstrTyped, int iLimit)
{
    tag_SearchAnswer answer = m_search.Find(wstrTyped, m_bNarrow ? m_pLast.get() : nullptr);
    tag_SearchStep step{};
    step.strTyped = Utf8Text(wstrTyped);
    step.uMask = answer.uMask;
    step.vCandidates = std::move(answer.vCandidates);
    step.iTotal = answer.pResult->iResultNum;
    step.vBest = FirstPage(*answer.pResult, iLimit);
    if (wstrTyped.empty())
    {
        step.vSections = Sections(*answer.pResult);
    }
    m_pLast = std::move(answer.pResult);
    return step;
}

std::vector<tag_FoundContact> CSearchSession::FirstPage(tag_LocalizerResult& result, int iLimit)
{
    std::vector<tag_FoundContact> vPage;
    const int iCount = iLimit == 0 ? result.iResultNum : iLimit;
    for (const tag_LocalizerDetail& detail : m_search.Page(result, 0, iCount))
    {
        vPage.push_back({detail, m_fnNames(detail)});
    }
    return vPage;
}

std::vector<tag_Section> CSearchSession::Sections(tag_LocalizerResult& result)
{
    const bool bTimeOrder = m_search.Logic().GetSortType() == STORE_ORDER_TIME;
    int aiCounts[LETTER_SECTIONS] = {};
    m_search.Logic().GetFirstWordInfo(&result, aiCounts);
    std::vector<tag_Section> vSections;
    for (int i = 0; i < (bTimeOrder ? TIME_SECTIONS : LETTER_SECTIONS); ++i)
    {
        if (aiCounts[i] > 0)
        {
            vSections.push_back({SectionLabel(i, bTimeOrder), aiCounts[i]});
        }
    }
    return vSections;
}
