#ifndef QV_TOOLS_TYPINGVIEW_H
#define QV_TOOLS_TYPINGVIEW_H

#include <string>
#include <vector>

class CTypingModel;

// How a piece of text is shown.
enum TEXT_STYLE : unsigned
{
    STYLE_PLAIN = 0,
    STYLE_MATCHED = 1,  // matched characters of a name
    STYLE_LIT = 2,      // a key that leads to a match
    STYLE_DIM = 4,      // a key that does not; less important text
    STYLE_HEADING = 8,  // of a section
    STYLE_SELECTED = 16 // the row of the selected contact
};

struct tag_StyledText
{
    std::string strText; // UTF-8, printable
    unsigned uStyle;
};
using StyledLine = std::vector<tag_StyledText>;

struct tag_ScreenSize
{
    int iRows;
    int iColumns;
};

// The rows of the terminal, none wider than it.
struct tag_Screen
{
    std::vector<StyledLine> vLines;
    int iCursorRow;
    int iCursorColumn;
};

constexpr tag_ScreenSize SMALLEST_SCREEN = {12, 40};

// Lays the search out, from the top: the typed text, the list in the remaining room, the candidate
// characters with the row of letters or else the keypad, the filters, and a line with help or a
// message and the time of the last key. A screen that is too small shows one line that says so. The
// model's list gets the size of the screen. Widths are those of the process's locale, a UTF-8 one.
tag_Screen LayOut(CTypingModel& model, const tag_ScreenSize& size);

#endif
