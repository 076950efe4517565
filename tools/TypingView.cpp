#include "tools/TypingView.h"

#include "tools/PrintableText.h"
#include "tools/SearchReport.h"
#include "tools/TypingModel.h"
#include "tools/Utf8Text.h"

#include <algorithm>
#include <cwchar>
#include <iterator>

namespace
{

constexpr const char* LETTER_KEYS = "abcdefghijklmnopqrstuvwxyz#";
constexpr const char* UNLIT = "·";
constexpr const char* CUT = "…";
constexpr const char* UNSHOWABLE = "\xEF\xBF\xBD"; // U+FFFD
constexpr int KEYPAD_ROWS = 4;
constexpr int KEYPAD_COLUMNS = 3;
constexpr int KEY_WIDTH = 10;
constexpr size_t LETTERS_OF_KEY = 4;
constexpr int CANDIDATE_WIDTH = 4; // number, character, blank
constexpr int SPACED_LETTERS = 54; // columns that the letters take with blanks between them
constexpr int ROOMY_ROWS = 18;     // from here on, blank rows set the parts apart
constexpr int ROOMY_COLUMNS = 76;

struct tag_KeypadKey
{
    char chKey;
    const char* szLetters;
};

constexpr tag_KeypadKey KEYPAD[KEYPAD_ROWS * KEYPAD_COLUMNS] = {
    {'1', ""},     {'2', "abc"}, {'3', "def"},  {'4', "ghi"}, {'5', "jkl"}, {'6', "mno"},
    {'7', "pqrs"}, {'8', "tuv"}, {'9', "wxyz"}, {'*', ""},    {'0', ""},    {'#', ""}};

// Columns of a character on the terminal, -1 where it cannot be shown.
int WidthOf(const std::string& strCharacter)
{
    wchar_t chWide = 0;
    std::mbstate_t state = {};
    const size_t uBytes = std::mbrtowc(&chWide, strCharacter.data(), strCharacter.size(), &state);
    return uBytes == strCharacter.size() ? wcwidth(chWide) : -1;
}

int TextWidth(const std::string& strText)
{
    int iWidth = 0;
    for (const std::string& strCharacter : Characters(strText))
    {
        iWidth += std::max(0, WidthOf(strCharacter));
    }
    return iWidth;
}

// A line as it grows; what does not fit is left out.
class CLineBuilder
{
public:
    CLineBuilder(int iColumns, unsigned uStyle = STYLE_PLAIN)
        : m_iColumns(iColumns), m_uStyle(uStyle)
    {
    }

    // Adds what fits before iEnd, or the end of the line. False when something was left out.
    bool Add(const std::string& strText, unsigned uStyle = STYLE_PLAIN, int iEnd = -1)
    {
        const int iLimit = iEnd < 0 ? m_iColumns : iEnd;
        for (const std::string& strCharacter : Characters(strText))
        {
            const int iWidth = WidthOf(strCharacter);
            if (m_iColumn + (iWidth < 0 ? 1 : iWidth) > iLimit)
            {
                return false;
            }
            Append(iWidth < 0 ? UNSHOWABLE : strCharacter, uStyle);
            m_iColumn += iWidth < 0 ? 1 : iWidth;
        }
        return true;
    }
    void PadTo(int iColumn)
    {
        Add(std::string(static_cast<size_t>(std::max(0, iColumn - m_iColumn)), ' '));
    }
    // Adds the text at the right edge if it fits.
    void AddRight(const std::string& strText, unsigned uStyle = STYLE_PLAIN)
    {
        const int iBegin = m_iColumns - TextWidth(strText);
        if (iBegin > m_iColumn)
        {
            PadTo(iBegin);
            Add(strText, uStyle);
        }
    }
    int Column() const { return m_iColumn; }
    StyledLine Take() { return std::move(m_line); }

private:
    void Append(const std::string& strText, unsigned uStyle)
    {
        if (m_line.empty() || m_line.back().uStyle != (uStyle | m_uStyle))
        {
            m_line.push_back({"", uStyle | m_uStyle});
        }
        m_line.back().strText += strText;
    }

    int m_iColumns;
    unsigned m_uStyle; // of everything on the line
    int m_iColumn = 0;
    StyledLine m_line;
};

std::string Contacts(int iCount)
{
    return std::to_string(iCount) + (iCount == 1 ? " contact" : " contacts");
}

std::string SectionName(wchar_t chIndex)
{
    switch (chIndex)
    {
    case L'1':
        return "in the last 30 days";
    case L'2':
        return "30 to 90 days ago";
    case L'3':
        return "90 to 180 days ago";
    case L'4':
        return "180 to 360 days ago";
    case L'5':
        return "longer ago";
    default:
        return std::string(1, chIndex == 0 ? '#' : static_cast<char>(chIndex));
    }
}

// Lays out one screen of a model.
class CLayout
{
public:
    CLayout(CTypingModel& model, const tag_ScreenSize& size) : m_model(model), m_size(size) {}

    tag_Screen Make()
    {
        tag_Screen screen = {};
        if (m_size.iRows < SMALLEST_SCREEN.iRows || m_size.iColumns < SMALLEST_SCREEN.iColumns)
        {
            screen.vLines.push_back(TooSmall());
            return screen;
        }
        const std::vector<StyledLine> vBelow = BelowList();
        const int iListEnd = m_size.iRows - 1 - static_cast<int>(vBelow.size());
        m_model.SetListRows(iListEnd - 1); // below the typed text
        screen.vLines.push_back(TypedText(screen));
        AddList(screen.vLines);
        screen.vLines.resize(static_cast<size_t>(iListEnd));
        screen.vLines.insert(screen.vLines.end(), vBelow.begin(), vBelow.end());
        screen.vLines.push_back(Status()); // last: reading the list may leave a message
        return screen;
    }

private:
    StyledLine TooSmall() const
    {
        CLineBuilder line(m_size.iColumns);
        line.Add("needs " + std::to_string(SMALLEST_SCREEN.iColumns) + " x " +
                 std::to_string(SMALLEST_SCREEN.iRows));
        return line.Take();
    }

    StyledLine TypedText(tag_Screen& screen) const
    {
        CLineBuilder line(m_size.iColumns);
        line.Add(m_model.Keys() == TYPING_DIGITS ? "123> " : "abc> ", STYLE_DIM);
        line.Add(PrintableText(Utf8Text(m_model.Current().wstrText)));
        screen.iCursorColumn = std::min(line.Column(), m_size.iColumns - 1);
        line.Add(" ");
        line.AddRight(Contacts(m_model.Total()));
        return line.Take();
    }

    void AddList(std::vector<StyledLine>& vLines)
    {
        if (m_model.Total() == 0)
        {
            vLines.push_back({{"  no contact matches", STYLE_DIM}});
            return;
        }
        for (const tag_ListRow& row : m_model.ListRows())
        {
            vLines.push_back(row.pSection != nullptr ? Heading(*row.pSection) : Contact(row));
        }
    }

    StyledLine Heading(const tag_SectionRun& section) const
    {
        CLineBuilder line(m_size.iColumns);
        line.Add(SectionName(section.chIndex), STYLE_HEADING);
        line.Add(" (" + std::to_string(section.iCount) + ")", STYLE_DIM);
        return line.Take();
    }

    // Name and id. The whole row of the selected contact is marked, up to the edge.
    StyledLine Contact(const tag_ListRow& row) const
    {
        const bool bSelected = row.iEntry == m_model.Current().iSelected;
        const std::string strID = std::to_string(row.contact.detail.iContactID);
        CLineBuilder line(m_size.iColumns, bSelected ? STYLE_SELECTED : STYLE_PLAIN);
        line.Add(bSelected ? "> " : "  ");
        AddName(line, row.contact, m_size.iColumns - static_cast<int>(strID.size()) - 2);
        line.AddRight(strID, STYLE_DIM);
        return line.Take();
    }

    // A name has one code per character, so positions of codes are those of characters.
    void AddName(CLineBuilder& line, const tag_FoundContact& contact, int iEnd) const
    {
        if (contact.strName.empty())
        {
            line.Add("(no name)", STYLE_DIM);
            return;
        }
        const bool bMark = !m_model.Current().wstrText.empty();
        int iCharacter = 0;
        for (const std::string& strCharacter : Characters(contact.strName))
        {
            const bool bMatched = bMark && iCharacter >= FirstMatched(contact.detail) &&
                                  iCharacter <= LastMatched(contact.detail);
            if (!line.Add(PrintableText(strCharacter), bMatched ? STYLE_MATCHED : STYLE_PLAIN,
                          iEnd))
            {
                line.Add(CUT, STYLE_DIM);
                return;
            }
            ++iCharacter;
        }
    }

    // All lines below the list but the last.
    std::vector<StyledLine> BelowList() const
    {
        std::vector<StyledLine> vLines;
        const bool bRoomy = m_size.iRows >= ROOMY_ROWS;
        if (bRoomy)
        {
            vLines.emplace_back();
        }
        if (m_model.Keys() == TYPING_DIGITS)
        {
            AddKeypad(vLines);
        }
        else
        {
            vLines.push_back(Candidates());
            vLines.push_back(Letters());
        }
        if (bRoomy)
        {
            vLines.emplace_back();
        }
        vLines.push_back(Filters());
        return vLines;
    }

    bool IsLit(char chKey) const
    {
        return m_model.Current().strNextKeys.find(chKey) != std::string::npos;
    }

    void AddKeypad(std::vector<StyledLine>& vLines) const
    {
        for (int iRow = 0; iRow < KEYPAD_ROWS; ++iRow)
        {
            CLineBuilder line(m_size.iColumns);
            for (int i = 0; i < KEYPAD_COLUMNS; ++i)
            {
                const tag_KeypadKey& key = KEYPAD[iRow * KEYPAD_COLUMNS + i];
                const bool bLit = IsLit(key.chKey);
                std::string strLabel = std::string(1, key.chKey) + " " + key.szLetters;
                strLabel.resize(2 + LETTERS_OF_KEY, ' ');
                line.PadTo(i * KEY_WIDTH);
                line.Add((bLit ? "[" : " ") + strLabel + (bLit ? "]" : " "),
                         bLit ? STYLE_LIT : STYLE_DIM);
            }
            vLines.push_back(line.Take());
        }
    }

    // Every letter keeps its place, lit or not.
    StyledLine Letters() const
    {
        CLineBuilder line(m_size.iColumns);
        const bool bSpaced = m_size.iColumns >= SPACED_LETTERS;
        for (const char* pKey = LETTER_KEYS; *pKey != '\0'; ++pKey)
        {
            const bool bLit = IsLit(*pKey);
            line.Add(bLit ? std::string(1, *pKey) : UNLIT, bLit ? STYLE_LIT : STYLE_DIM);
            line.Add(bSpaced ? " " : "");
        }
        return line.Take();
    }

    StyledLine Candidates() const
    {
        CLineBuilder line(m_size.iColumns);
        const std::vector<std::string>& vAll = m_model.Current().answer.vCandidates;
        const int iFirst = m_model.Current().iFirstCandidate;
        const int iEnd =
            std::min(iFirst + CTypingModel::CANDIDATES_SHOWN, static_cast<int>(vAll.size()));
        for (int i = iFirst; i < iEnd; ++i)
        {
            line.PadTo((i - iFirst) * CANDIDATE_WIDTH);
            line.Add(std::to_string(i - iFirst + 1), STYLE_DIM);
            line.Add(PrintableText(vAll[static_cast<size_t>(i)]));
        }
        const int iMore = static_cast<int>(vAll.size()) - iEnd;
        if (iMore > 0)
        {
            line.AddRight("+" + std::to_string(iMore), STYLE_DIM);
        }
        return line.Take();
    }

    StyledLine Filters() const
    {
        CLineBuilder line(m_size.iColumns);
        int iKey = 2;
        for (const tag_FilterSwitch& filter : FILTER_SWITCHES)
        {
            const bool bOn = m_model.IsFiltered(filter.iKind);
            line.Add(iKey == 2 ? "" : " ");
            line.Add("F" + std::to_string(iKey), STYLE_DIM);
            line.Add(bOn ? "[x]" : "[ ]", bOn ? STYLE_LIT : STYLE_DIM);
            line.Add(filter.szLabel, bOn ? STYLE_LIT : STYLE_PLAIN);
            ++iKey;
        }
        for (const tag_ChosenFilter& filter : m_model.Filters())
        {
            if (!HasSwitch(filter))
            {
                line.Add(" " + filter.strName +
                             (filter.bHasID ? " " + std::to_string(filter.iID) : ""),
                         STYLE_LIT);
            }
        }
        return line.Take();
    }

    static bool HasSwitch(const tag_ChosenFilter& chosen)
    {
        return std::any_of(FILTER_SWITCHES.begin(), FILTER_SWITCHES.end(),
                           [&chosen](const tag_FilterSwitch& filter)
                           { return filter.iKind == chosen.iKind; });
    }

    StyledLine Status() const
    {
        const std::string strTime = std::to_string(m_model.KeyTime().count()) + " µs";
        CLineBuilder line(m_size.iColumns);
        const bool bHelp = m_model.Message().empty();
        line.Add(bHelp ? Help() : PrintableText(m_model.Message()),
                 bHelp ? STYLE_DIM : STYLE_HEADING);
        line.AddRight(strTime, STYLE_DIM);
        return line.Take();
    }

    std::string Help() const
    {
        const std::string strTab = m_model.Keys() == TYPING_DIGITS ? "Tab abc" : "Tab 123";
        if (m_size.iColumns < ROOMY_COLUMNS)
        {
            return strTab + "  Enter choose  Esc end";
        }
        std::string strTurn;
        if (!m_model.Current().answer.vCandidates.empty())
        {
            strTurn = "  1-9 pick  Left/Right more";
        }
        else if (!m_model.Current().vSections.empty())
        {
            strTurn = "  Left/Right section";
        }
        return strTab + strTurn + "  Enter choose  Esc end";
    }

    CTypingModel& m_model;
    tag_ScreenSize m_size;
};

} // namespace

tag_Screen LayOut(CTypingModel& model, const tag_ScreenSize& size)
{
    return CLayout(model, size).Make();
}
