#ifndef QV_TOOLS_TYPINGMODEL_H
#define QV_TOOLS_TYPINGMODEL_H

#include "tools/ContactNames.h"
#include "tools/ContactSearch.h"
#include "tools/FilterOptions.h"
#include "tools/IndexWatch.h"
#include "tools/SearchSession.h"

#include <chrono>
#include <map>
#include <memory>
#include <string>
#include <vector>

enum TYPING_KEYS
{
    TYPING_LETTERS,
    TYPING_DIGITS,
};

// A filter that a key switches on and off.
struct tag_FilterSwitch
{
    const char* szName; // of the option
    const char* szLabel;
    int iKind;
};
extern const std::vector<tag_FilterSwitch> FILTER_SWITCHES;

// The entries from iFirst on that share an index character.
struct tag_SectionRun
{
    int iFirst;
    int iCount;
    wchar_t chIndex;
};

// What the list shows in one row: the heading of a section, or a contact.
struct tag_ListRow
{
    const tag_SectionRun* pSection; // null for a contact
    int iEntry;
    tag_FoundContact contact;
};

// A typed text and its result, in the state in which the next key left it.
struct tag_TypedText
{
    std::wstring wstrText;
    tag_SearchAnswer answer;
    std::vector<tag_SectionRun> vSections; // of an empty text
    std::string strNextKeys;               // letters and #, or digits, that lead to matches
    int iSelected = 0;                     // entry
    int iTopRow = 0;                       // of the list
    int iFirstCandidate = 0;               // of those that are shown
};

// A contact search while it is typed: handles the keys and provides everything to show,
// independently of the terminal.
//
// Each further key searches within the result before it. The results are kept, so that going back
// needs no search. A failure changes nothing, and Message reports it.
class CTypingModel
{
public:
    static constexpr int CANDIDATES_SHOWN = 9; // picked with the keys 1 to 9

    // Searches for the empty text. Throws CToolError.
    CTypingModel(std::vector<tag_ChosenFilter> vFilters, TYPING_KEYS eKeys);

    void Type(wchar_t chKey);
    void Back();
    void SwitchKeys(); // to the other kind of keys, with an empty text
    void SwitchFilter(size_t uSwitch);
    void MoveBy(int iEntries);
    void MoveByPages(int iPages);
    void MoveToEnd(bool bLast);
    void Turn(int iPages); // the candidates, or the sections if there are none
    // Searches anew from the first key if another process changed the index.
    void FollowIndex();
    // The rows that the list has on the screen.
    void SetListRows(int iRows);

    TYPING_KEYS Keys() const { return m_eKeys; }
    const tag_TypedText& Current() const { return m_vTyped.back(); }
    int Total() const { return Current().answer.pResult->iResultNum; }
    const std::vector<tag_ChosenFilter>& Filters() const { return m_vFilters; }
    bool IsFiltered(int iKind) const;
    // The rows of the list that are on the screen.
    std::vector<tag_ListRow> ListRows();
    // The contact that Enter selects; null if nothing was found.
    std::unique_ptr<tag_FoundContact> Selected();
    // A message on the last key, or on an index that could not be followed; may be empty.
    const std::string& Message() const
    {
        return m_strTrouble.empty() ? m_strMessage : m_strTrouble;
    }
    std::chrono::microseconds KeyTime() const { return m_keyTime; }

private:
    // The searches of one chain of filters and one kind of keys.
    struct tag_Searches
    {
        std::unique_ptr<CFilterChain> chain;
        std::unique_ptr<CContactSearch> search;
        ContactNameLookup fnNames;
        std::map<int, std::string> mapNames; // by contact
    };

    template <typename Action>
    void Try(const Action& action);
    static std::unique_ptr<tag_Searches> MakeSearches(const std::vector<tag_ChosenFilter>& vFilters,
                                                      TYPING_KEYS eKeys);
    std::vector<std::wstring> Texts() const;
    void SearchAnew(const std::vector<tag_ChosenFilter>& vFilters, TYPING_KEYS eKeys,
                    const std::vector<std::wstring>& vTexts);
    tag_TypedText Search(CContactSearch& search, const std::wstring& wstrText,
                         tag_LocalizerResult* pWithin, TYPING_KEYS eKeys);
    void TypeText(const std::wstring& wstrText);
    void Pick(int iShown);
    std::vector<std::wstring> Replacements(const std::wstring& wstrWord);
    void Select(int iEntry);
    const tag_LocalizerDetail& Entry(int iEntry) const;
    std::string NameOf(const tag_LocalizerDetail& detail);
    int RowOf(int iEntry) const;
    tag_ListRow Row(int iRow);
    int SectionOf(int iEntry) const;

    std::vector<tag_ChosenFilter> m_vFilters;
    TYPING_KEYS m_eKeys;
    CIndexWatch m_watch;
    std::unique_ptr<tag_Searches> m_pSearches;
    std::vector<tag_TypedText> m_vTyped; // the empty text first; gone before m_pSearches
    int m_iListRows = 1;
    std::string m_strMessage;
    std::string m_strTrouble;
    std::chrono::microseconds m_keyTime{0};
};

#endif
