#ifndef QV_TOOLS_SEARCHSESSION_H
#define QV_TOOLS_SEARCHSESSION_H

#include "Core/Records/SearchRecords.h"
#include "tools/ContactNames.h"
#include "tools/ContactSearch.h"

#include <string>
#include <vector>

class CFilterChain;

// One ranked contact of a search.
struct tag_FoundContact
{
    tag_LocalizerDetail detail;
    std::string strName; // UTF-8
};

// A section of the index that an empty text lists.
struct tag_Section
{
    std::string strLabel; // "A".."Z" and "#", or "1".."5" and "-" in time order
    int iContacts;
};

// The result of one search.
struct tag_SearchStep
{
    std::string strTyped;
    int iTotal;                           // matches
    std::vector<tag_FoundContact> vBest;  // the first of them in rank order
    uint32_t uMask;                       // as the library reports it
    std::vector<std::string> vCandidates; // characters that the last letters may stand for
    std::vector<tag_Section> vSections;   // not empty for an empty text only
};

// The searches of a text that is typed key by key.
class CSearchSession
{
public:
    // With bNarrow each search after the first is incremental, within the matches of the one
    // before. The chain must outlive the session.
    CSearchSession(IME_SEARCH_TYPE eType, CFilterChain& chain, bool bNarrow,
                   ContactNameLookup fnNames);

    // Searches for the whole text typed so far and returns the first iLimit matches, all for 0.
    // Throws CToolError.
    tag_SearchStep Search(const std::wstring& wstrTyped, int iLimit);

private:
    std::vector<tag_FoundContact> FirstPage(tag_LocalizerResult& result, int iLimit);
    std::vector<tag_Section> Sections(tag_LocalizerResult& result);

    CContactSearch m_search;
    bool m_bNarrow;
    ContactNameLookup m_fnNames;
    SearchResultPtr m_pLast;
};

#endif
