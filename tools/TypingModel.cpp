#include "tools/TypingModel.h"

#include "Filter/Filter.h"
#include "LocalizerImpl/QVLocalizerManager.h"
#include "tools/SearchReport.h"
#include "tools/ToolError.h"
#include "tools/Utf8Text.h"

#include <algorithm>
#include <iterator>
#include <utility>

const std::vector<tag_FilterSwitch> FILTER_SWITCHES = {
    {"starred", "favourites", FILTER_FAVOURITES},
    {"phone", "phone", FILTER_PHONE},
    {"online", "online", FILTER_ONLINE},
};

namespace
{

using Clock = std::chrono::steady_clock;

constexpr char LETTERS[] = "abcdefghijklmnopqrstuvwxyz";
constexpr char DIGITS[] = "0123456789";
constexpr wchar_t ANY_SIGN = L'#';

bool IsDigit(wchar_t chKey)
{
    return chKey >= L'0' && chKey <= L'9';
}

// The key as it is typed into a text; 0 for one that no search accepts. A blank in a name matches
// like every other sign.
wchar_t TypedKey(wchar_t chKey, TYPING_KEYS eKeys)
{
    if (eKeys == TYPING_DIGITS)
    {
        return IsDigit(chKey) ? chKey : 0;
    }
    if (chKey == L' ')
    {
        return ANY_SIGN;
    }
    if (chKey >= L'A' && chKey <= L'Z')
    {
        return chKey - L'A' + L'a';
    }
    const bool bLetter = chKey >= L'a' && chKey <= L'z';
    const bool bBeyondAscii = chKey > 0x7F && chKey <= 0xFFFF;
    return bLetter || bBeyondAscii || chKey == ANY_SIGN ? chKey : 0;
}

// Entries with an index character, in the order of the result.
std::vector<tag_SectionRun> SectionRuns(const tag_LocalizerResult& result)
{
    std::vector<tag_SectionRun> vRuns;
    for (int i = 0; i < result.iResultNum; ++i)
    {
        const wchar_t chIndex = static_cast<wchar_t>(result.pDetail[i].iFirstWord);
        if (vRuns.empty() || vRuns.back().chIndex != chIndex)
        {
            vRuns.push_back({i, 0, chIndex});
        }
        ++vRuns.back().iCount;
    }
    return vRuns;
}

// The keys in the mask of a search. A digit stands for itself only: on a keypad no key matches a
// sign.
std::string KeysOfMask(uint32_t uMask, TYPING_KEYS eKeys)
{
    std::string strKeys;
    for (const std::string& strKey : NextKeys(uMask, eKeys == TYPING_DIGITS))
    {
        strKeys += eKeys == TYPING_DIGITS && strKey == "#" ? "" : strKey;
    }
    return strKeys;
}

// Whether the mask may lack a key. It has all letters that begin a character, so all that can
// follow an empty text, but does not say which digits; for other texts it lacks the keys that
// continue a reading typed in digits, and those of a second match in the same name.
bool MayMaskLack(const std::wstring& wstrText, TYPING_KEYS eKeys, uint32_t uMask)
{
    return !wstrText.empty() || (eKeys == TYPING_DIGITS && (uMask & MASK_OTHER) != 0);
}

// All keys that lead from a text to at least one match.
std::string KeysThatLeadOn(CContactSearch& search, const tag_TypedText& typed, TYPING_KEYS eKeys)
{
    const tag_SearchAnswer& answer = typed.answer;
    if (answer.pResult->iResultNum == 0 || typed.wstrText.size() >= LOC_MAX_INPUT)
    {
        return "";
    }
    std::string strKeys = KeysOfMask(answer.uMask, eKeys);
    for (const char chKey : std::string(eKeys == TYPING_DIGITS ? DIGITS : LETTERS) +
                                (eKeys == TYPING_DIGITS ? "" : "#"))
    {
        if (strKeys.find(chKey) == std::string::npos &&
            MayMaskLack(typed.wstrText, eKeys, answer.uMask) &&
            search.Find(typed.wstrText + static_cast<wchar_t>(chKey), answer.pResult.get())
                    .pResult->iResultNum > 0)
        {
            strKeys += chKey;
        }
    }
    return strKeys;
}

} // namespace

CTypingModel::CTypingModel(std::vector<tag_ChosenFilter> vFilters, TYPING_KEYS eKeys)
    : m_vFilters(std::move(vFilters)), m_eKeys(eKeys)
{
    SearchAnew(m_vFilters, m_eKeys, {L""});
}

// Runs the action of a key and reports a failure as the message.
template <typename Action>
void CTypingModel::Try(const Action& action)
{
    m_strMessage.clear();
    try
    {
        action();
    }
    catch (const CToolError& error)
    {
        m_strMessage = error.what();
    }
}

void CTypingModel::Type(wchar_t chKey)
{
    FollowIndex();
    if (m_eKeys == TYPING_LETTERS && IsDigit(chKey))
    {
        Try([&] { Pick(static_cast<int>(chKey - L'1')); });
        return;
    }
    const wchar_t chTyped = TypedKey(chKey, m_eKeys);
    if (chTyped == 0)
    {
        m_strMessage = m_eKeys == TYPING_DIGITS ? "digits only; Tab turns to letters"
                                                : "letters only; # for a sign or digit";
    }
    else if (Current().wstrText.size() >= LOC_MAX_INPUT)
    {
        m_strMessage = "a search takes 10 characters";
    }
    else
    {
        Try([&] { TypeText(Current().wstrText + chTyped); });
    }
}

void CTypingModel::TypeText(const std::wstring& wstrText)
{
    m_vTyped.push_back(
        Search(*m_pSearches->search, wstrText, Current().answer.pResult.get(), m_eKeys));
}

// Within a result, or the whole index when it is null. Sets the time of the key.
tag_TypedText CTypingModel::Search(CContactSearch& search, const std::wstring& wstrText,
                                   tag_LocalizerResult* pWithin, TYPING_KEYS eKeys)
{
    tag_TypedText typed;
    typed.wstrText = wstrText;
    const Clock::time_point begin = Clock::now();
    typed.answer = search.Find(wstrText, pWithin);
    m_keyTime = std::chrono::duration_cast<std::chrono::microseconds>(Clock::now() - begin);
    if (wstrText.empty())
    {
        typed.vSections = SectionRuns(*typed.answer.pResult);
    }
    typed.strNextKeys = KeysThatLeadOn(search, typed, eKeys);
    return typed;
}

void CTypingModel::Back()
{
    m_strMessage.clear();
    const Clock::time_point begin = Clock::now();
    if (m_vTyped.size() > 1)
    {
        m_vTyped.pop_back();
    }
    m_keyTime = std::chrono::duration_cast<std::chrono::microseconds>(Clock::now() - begin);
    FollowIndex();
}

void CTypingModel::Pick(int iShown)
{
    const std::vector<std::string>& vCandidates = Current().answer.vCandidates;
    const int iCandidate = Current().iFirstCandidate + iShown;
    if (iShown < 0 || iCandidate >= static_cast<int>(vCandidates.size()))
    {
        m_strMessage = "no character has this number";
        return;
    }
    const std::vector<std::wstring> vTexts =
        Replacements(WideText(vCandidates[static_cast<size_t>(iCandidate)]));
    for (const std::wstring& wstrText : vTexts)
    {
        TypeText(wstrText);
        if (Total() > 0 || &wstrText == &vTexts.back())
        {
            return;
        }
        m_vTyped.pop_back();
    }
}

// The texts that the library makes of the typed one and a picked character, the one with most
// letters left first. The library replaces the letters from the last one before a position that
// begins a reading: in "nan" that is the second n, while 南 stands for all three letters. Earlier
// positions reach the earlier letters.
std::vector<std::wstring> CTypingModel::Replacements(const std::wstring& wstrWord)
{
    std::vector<std::wstring> vTexts;
    const std::wstring& wstrTyped = Current().wstrText;
    for (int iPos = static_cast<int>(wstrTyped.size()); iPos > 0; --iPos)
    {
        std::wstring wstrText = m_pSearches->search->Replace(wstrTyped, iPos, wstrWord);
        const bool bReplaced =
            wstrText.size() >= wstrWord.size() &&
            wstrText.compare(wstrText.size() - wstrWord.size(), wstrWord.size(), wstrWord) == 0;
        if (bReplaced && (vTexts.empty() || vTexts.back() != wstrText))
        {
            vTexts.push_back(std::move(wstrText));
        }
    }
    return vTexts;
}

void CTypingModel::SwitchKeys()
{
    // The texts typed so far belong to the other kind of keys.
    const TYPING_KEYS eKeys = m_eKeys == TYPING_LETTERS ? TYPING_DIGITS : TYPING_LETTERS;
    Try([&] { SearchAnew(m_vFilters, eKeys, {L""}); });
}

void CTypingModel::SwitchFilter(size_t uSwitch)
{
    const tag_FilterSwitch& filter = FILTER_SWITCHES[uSwitch];
    std::vector<tag_ChosenFilter> vFilters = m_vFilters;
    if (IsFiltered(filter.iKind))
    {
        vFilters.erase(std::remove_if(vFilters.begin(), vFilters.end(),
                                      [&filter](const tag_ChosenFilter& chosen)
                                      { return chosen.iKind == filter.iKind; }),
                       vFilters.end());
    }
    else
    {
        vFilters.push_back({filter.szName, filter.iKind, false, 0});
    }
    Try([&] { SearchAnew(vFilters, m_eKeys, Texts()); });
}

bool CTypingModel::IsFiltered(int iKind) const
{
    return std::any_of(m_vFilters.begin(), m_vFilters.end(),
                       [iKind](const tag_ChosenFilter& filter) { return filter.iKind == iKind; });
}

void CTypingModel::FollowIndex()
{
    if (!m_watch.Changed())
    {
        return;
    }
    try
    {
        SearchAnew(m_vFilters, m_eKeys, Texts());
        m_strTrouble.clear();
    }
    catch (const CToolError& error)
    {
        m_strTrouble = error.what(); // the next call tries again
    }
}

std::unique_ptr<CTypingModel::tag_Searches>
CTypingModel::MakeSearches(const std::vector<tag_ChosenFilter>& vFilters, TYPING_KEYS eKeys)
{
    auto pSearches = std::make_unique<tag_Searches>();
    CLocalizerLogic logic;
    pSearches->chain = MakeFilterChain(logic, vFilters);
    pSearches->search = std::make_unique<CContactSearch>(
        eKeys == TYPING_DIGITS ? IME_SEARCH_NUM : IME_SEARCH_WORD, *pSearches->chain);
    pSearches->fnNames = LookUpInDatabase();
    return pSearches;
}

// All texts up to the current one as they were typed.
std::vector<std::wstring> CTypingModel::Texts() const
{
    std::vector<std::wstring> vTexts;
    for (const tag_TypedText& typed : m_vTyped)
    {
        vTexts.push_back(typed.wstrText);
    }
    return vTexts;
}

// Searches for the texts, the first in the whole index and each further one in the result before
// it, and keeps the selected contact if the user moved to it. If it throws, nothing has changed.
void CTypingModel::SearchAnew(const std::vector<tag_ChosenFilter>& vFilters, TYPING_KEYS eKeys,
                              const std::vector<std::wstring>& vTexts)
{
    CIndexWatch watch;
    watch.Note();
    std::unique_ptr<tag_Searches> pSearches = MakeSearches(vFilters, eKeys);
    std::vector<tag_TypedText> vTyped;
    for (const std::wstring& wstrText : vTexts)
    {
        tag_LocalizerResult* pWithin =
            vTyped.empty() ? nullptr : vTyped.back().answer.pResult.get();
        vTyped.push_back(Search(*pSearches->search, wstrText, pWithin, eKeys));
    }
    const int iSelectedID =
        m_vTyped.empty() || Current().iSelected == 0 ? 0 : Entry(Current().iSelected).iContactID;
    m_vTyped = std::move(vTyped); // releases the old results before the search that made them
    m_pSearches = std::move(pSearches);
    m_vFilters = vFilters;
    m_eKeys = eKeys;
    m_watch = watch;
    Select(iSelectedID == 0 ? 0
                            : m_pSearches->search->Logic().GetIndexByContactsId(
                                  Current().answer.pResult.get(), iSelectedID));
}

void CTypingModel::Select(int iEntry)
{
    tag_TypedText& typed = m_vTyped.back();
    typed.iSelected = std::max(0, std::min(iEntry, Total() - 1));
    const int iRow = RowOf(typed.iSelected);
    // The first contact of a section is shown with the heading if the list has room for both.
    const bool bFirst =
        !typed.vSections.empty() &&
        typed.vSections[static_cast<size_t>(SectionOf(typed.iSelected))].iFirst == typed.iSelected;
    const int iFrom = bFirst && m_iListRows > 1 ? iRow - 1 : iRow;
    typed.iTopRow = std::max(std::min(typed.iTopRow, iFrom), iRow - m_iListRows + 1);
    const int iRows = Total() + static_cast<int>(typed.vSections.size());
    typed.iTopRow = std::max(0, std::min(typed.iTopRow, iRows - m_iListRows));
}

void CTypingModel::MoveBy(int iEntries)
{
    m_strMessage.clear();
    Select(Current().iSelected + iEntries);
}

void CTypingModel::MoveByPages(int iPages)
{
    MoveBy(iPages * std::max(1, m_iListRows - 1));
}

void CTypingModel::MoveToEnd(bool bLast)
{
    m_strMessage.clear();
    Select(bLast ? Total() - 1 : 0);
}

void CTypingModel::Turn(int iPages)
{
    m_strMessage.clear();
    tag_TypedText& typed = m_vTyped.back();
    const int iCandidates = static_cast<int>(typed.answer.vCandidates.size());
    if (iCandidates > 0)
    {
        const int iLastPage = (iCandidates - 1) / CANDIDATES_SHOWN;
        const int iPage = typed.iFirstCandidate / CANDIDATES_SHOWN + iPages;
        typed.iFirstCandidate = std::max(0, std::min(iPage, iLastPage)) * CANDIDATES_SHOWN;
    }
    else if (!typed.vSections.empty())
    {
        const int iLast = static_cast<int>(typed.vSections.size()) - 1;
        const int iSection = std::max(0, std::min(SectionOf(typed.iSelected) + iPages, iLast));
        Select(typed.vSections[static_cast<size_t>(iSection)].iFirst);
    }
}

void CTypingModel::SetListRows(int iRows)
{
    m_iListRows = std::max(1, iRows);
    Select(Current().iSelected);
}

const tag_LocalizerDetail& CTypingModel::Entry(int iEntry) const
{
    return Current().answer.pResult->pDetail[iEntry];
}

// Caches the names that were shown, so that redrawing the screen does not read the database.
std::string CTypingModel::NameOf(const tag_LocalizerDetail& detail)
{
    std::map<int, std::string>& mapNames = m_pSearches->mapNames;
    if (mapNames.find(detail.iContactID) == mapNames.end())
    {
        try
        {
            mapNames[detail.iContactID] = m_pSearches->fnNames(detail);
        }
        catch (const CToolError& error)
        {
            m_strMessage = error.what();
            return "";
        }
    }
    return mapNames[detail.iContactID];
}

int CTypingModel::SectionOf(int iEntry) const
{
    const std::vector<tag_SectionRun>& vSections = Current().vSections;
    const auto itBehind =
        std::find_if(vSections.begin(), vSections.end(),
                     [iEntry](const tag_SectionRun& section) { return section.iFirst > iEntry; });
    return static_cast<int>(std::distance(vSections.begin(), itBehind)) - 1;
}

// A heading stands before the first contact of each section.
int CTypingModel::RowOf(int iEntry) const
{
    return iEntry + SectionOf(iEntry) + 1;
}

tag_ListRow CTypingModel::Row(int iRow)
{
    int iHeadings = 0;
    for (const tag_SectionRun& section : Current().vSections)
    {
        if (section.iFirst + iHeadings == iRow)
        {
            return {&section, -1, {}};
        }
        if (section.iFirst + iHeadings > iRow)
        {
            break;
        }
        ++iHeadings;
    }
    const int iEntry = iRow - iHeadings;
    return {nullptr, iEntry, {Entry(iEntry), NameOf(Entry(iEntry))}};
}

std::vector<tag_ListRow> CTypingModel::ListRows()
{
    std::vector<tag_ListRow> vRows;
    const int iAll = Total() + static_cast<int>(Current().vSections.size());
    const int iEnd = std::min(Current().iTopRow + m_iListRows, iAll);
    for (int i = Current().iTopRow; i < iEnd; ++i)
    {
        vRows.push_back(Row(i));
    }
    return vRows;
}

std::unique_ptr<tag_FoundContact> CTypingModel::Selected()
{
    if (Total() == 0)
    {
        m_strMessage = "nobody to choose";
        return nullptr;
    }
    const tag_LocalizerDetail& detail = Entry(Current().iSelected);
    return std::make_unique<tag_FoundContact>(tag_FoundContact{detail, NameOf(detail)});
}
