#include "tools/SearchSession.h"

#include "LocalizerImpl/QVLocalizerManager.h"
#include "tools/LibraryLog.h"
#include "tools/ToolError.h"
#include "tools/Utf8Text.h"

#include <algorithm>
#include <utility>

namespace
{

// Ample room for the candidate characters, which the library leaves unterminated.
constexpr int WORD_BUFFER = 64;
static_assert(WORD_BUFFER > CN_WORD_MAX, "the buffer's last zeros end the text");

// Sections that the library counts: the index characters, then everybody else.
constexpr int LETTER_SECTIONS = 27;
constexpr int TIME_SECTIONS = 6;

[[noreturn]] void Fail(int iResult, const CLibraryLog& log)
{
    if (iResult == LOC_ERR_MAP)
    {
        throw CToolError(TOOL_EXIT_FAILED, "the search could not use the index's pinyin table",
                         BUILD_ANEW, log.Errors());
    }
    throw CToolError(TOOL_EXIT_FAILED, "the search failed (result " + std::to_string(iResult) + ")",
                     "", log.Errors());
}

// A store that cannot be read gives an empty result and lines in the log, not a result code.
void RequireStoreRead(const tag_LocalizerResult& result, const CLibraryLog& log)
{
    if (result.iResultNum == 0 && !log.Errors().empty())
    {
        throw CToolError(TOOL_EXIT_FAILED, log.WithReason("the index could not be read"),
                         "Try again when no other process holds it, or build it anew.",
                         log.Errors());
    }
}

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
    : m_eType(eType), m_chain(chain), m_bNarrow(bNarrow), m_fnNames(std::move(fnNames))
{
}

tag_SearchStep CSearchSession::Search(const std::wstring& wstrTyped, int iLimit)
{
    tag_SearchStep step{};
    step.strTyped = Utf8Text(wstrTyped);
    ResultPtr pResult = Ask(wstrTyped, step);
    step.iTotal = pResult->iResultNum;
    step.vBest = FirstPage(*pResult, iLimit);
    if (wstrTyped.empty())
    {
        step.vSections = Sections(*pResult);
    }
    m_pLast = std::move(pResult);
    return step;
}

CSearchSession::ResultPtr CSearchSession::Ask(const std::wstring& wstrTyped, tag_SearchStep& step)
{
    const CLibraryLog log;
    std::wstring wstrInput = wstrTyped; // the library changes what it searches for
    long lMask = 0;
    wchar_t szWords[WORD_BUFFER] = {};
    tag_LocalizerResult* pFound = nullptr;
    const int iResult = m_logic.Search(m_bNarrow ? m_pLast.get() : nullptr, wstrInput.data(),
                                       m_eType, &m_chain, 0, &pFound, &lMask, szWords);
    ResultPtr pResult(pFound,
                      [this](tag_LocalizerResult* pSet) { m_logic.FreeSearchResult(pSet); });
    if (iResult != 0 || pResult == nullptr)
    {
        Fail(iResult, log);
    }
    RequireStoreRead(*pResult, log);
    step.uMask = static_cast<uint32_t>(lMask);
    step.vCandidates = Characters(Utf8Text(szWords));
    return pResult;
}

std::vector<tag_FoundContact> CSearchSession::FirstPage(tag_LocalizerResult& result, int iLimit)
{
    std::vector<tag_FoundContact> vPage;
    const int iCount = iLimit == 0 ? result.iResultNum : std::min(iLimit, result.iResultNum);
    tag_LocalizerResult page = {};
    if (iCount > 0 && m_logic.GetSearchResult(&result, 0, iCount, &page) == 0)
    {
        for (int i = 0; i < page.iResultNum; ++i)
        {
            vPage.push_back({page.pDetail[i], m_fnNames(page.pDetail[i])});
        }
    }
    return vPage;
}

std::vector<tag_Section> CSearchSession::Sections(tag_LocalizerResult& result)
{
    const bool bTimeOrder = m_logic.GetSortType() == STORE_ORDER_TIME;
    int aiCounts[LETTER_SECTIONS] = {};
    m_logic.GetFirstWordInfo(&result, aiCounts);
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
