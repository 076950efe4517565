#ifndef QV_TOOLS_CONTACTSEARCH_H
#define QV_TOOLS_CONTACTSEARCH_H

#include "Core/LocalizerLogic.h"
#include "Core/Records/SearchRecords.h"

#include <cstdint>
#include <functional>
#include <memory>
#include <string>
#include <vector>

class CFilterChain;

// A result set of the library; the search that made it must outlive it.
using SearchResultPtr =
    std::unique_ptr<tag_LocalizerResult, std::function<void(tag_LocalizerResult*)>>;

// The answer of one search.
struct tag_SearchAnswer
{
    SearchResultPtr pResult;              // null before the search
    uint32_t uMask = 0;                   // as the library reports it
    std::vector<std::string> vCandidates; // characters that the last letters may stand for
};

// The library's search with failures thrown as CToolError.
class CContactSearch
{
public:
    // The chain must outlive the search.
    CContactSearch(IME_SEARCH_TYPE eType, CFilterChain& chain);

    // Searches within a result, or within the whole index when it is null.
    tag_SearchAnswer Find(const std::wstring& wstrTyped, tag_LocalizerResult* pWithin);
    // The entries of a result from iStart on, at most iCount of them.
    std::vector<tag_LocalizerDetail> Page(tag_LocalizerResult& result, int iStart, int iCount);
    // The typed text with the picked character in place of letters before iPos.
    std::wstring Replace(const std::wstring& wstrTyped, int iPos, const std::wstring& wstrWord);

    CLocalizerLogic& Logic() { return m_logic; }

private:
    CLocalizerLogic m_logic;
    IME_SEARCH_TYPE m_eType;
    CFilterChain& m_chain;
};

#endif
