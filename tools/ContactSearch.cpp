#include "tools/ContactSearch.h"

#include "LocalizerImpl/QVLocalizerManager.h"
#include "tools/LibraryLog.h"
#include "tools/ToolError.h"
#include "tools/Utf8Text.h"

#include <algorithm>

namespace
{

// Ample room for the candidate characters, which the library leaves unterminated.
constexpr int WORD_BUFFER = 64;
static_assert(WORD_BUFFER > CN_WORD_MAX, "the buffer's last zeros end the text");

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

// If the store cannot be read, the library returns an empty result and log lines, no result code.
void RequireStoreRead(const tag_LocalizerResult& result, const CLibraryLog& log)
{
    if (result.iResultNum == 0 && !log.Errors().empty())
    {
        throw CToolError(TOOL_EXIT_FAILED, log.WithReason("the index could not be read"),
                         "Try again when no other process holds it, or build it anew.",
                         log.Errors());
    }
}

} // namespace

CContactSearch::CContactSearch(IME_SEARCH_TYPE eType, CFilterChain& chain)
    : m_eType(eType), m_chain(chain)
{
}

tag_SearchAnswer CContactSearch::Find(const std::wstring& wstrTyped, tag_LocalizerResult* pWithin)
{
    const CLibraryLog log;
    std::wstring wstrInput = wstrTyped; // the library changes what it searches for
    long lMask = 0;
    wchar_t szWords[WORD_BUFFER] = {};
    tag_LocalizerResult* pFound = nullptr;
    const int iResult =
        m_logic.Search(pWithin, wstrInput.data(), m_eType, &m_chain, 0, &pFound, &lMask, szWords);
    SearchResultPtr pResult(pFound,
                            [this](tag_LocalizerResult* pSet) { m_logic.FreeSearchResult(pSet); });
    if (iResult != 0 || pResult == nullptr)
    {
        Fail(iResult, log);
    }
    RequireStoreRead(*pResult, log);
    return {std::move(pResult), static_cast<uint32_t>(lMask), Characters(Utf8Text(szWords))};
}

std::vector<tag_LocalizerDetail> CContactSearch::Page(tag_LocalizerResult& result, int iStart,
                                                      int iCount)
{
    tag_LocalizerResult page = {};
    const int iShown = std::min(iCount, result.iResultNum - iStart);
    if (iShown <= 0 || m_logic.GetSearchResult(&result, iStart, iShown, &page) != 0)
    {
        return {};
    }
    return {page.pDetail, page.pDetail + page.iResultNum};
}

std::wstring CContactSearch::Replace(const std::wstring& wstrTyped, int iPos,
                                     const std::wstring& wstrWord)
{
    const CLibraryLog log;
    std::wstring wstrInput = wstrTyped;
    std::wstring wstrPicked = wstrWord;
    std::wstring wstrReplaced(wstrInput.size() + wstrPicked.size() + 1, L'\0');
    const int iResult =
        m_logic.GetLocalizerString(wstrInput.data(), iPos, wstrPicked.data(), wstrReplaced.data());
    if (iResult != 0)
    {
        Fail(iResult, log);
    }
    wstrReplaced.resize(wstrReplaced.find(L'\0'));
    return wstrReplaced;
}
