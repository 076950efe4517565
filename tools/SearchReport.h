#ifndef QV_TOOLS_SEARCHREPORT_H
#define QV_TOOLS_SEARCHREPORT_H

#include "tools/FilterOptions.h"
#include "tools/SearchSession.h"

#include <iosfwd>
#include <string>
#include <vector>

// A whole search of the command line and its results.
struct tag_SearchReport
{
    std::string strType;  // "word", "num" or "special"
    std::string strInput; // UTF-8
    bool bNarrow = false;
    std::vector<tag_ChosenFilter> vFilters;
    std::vector<tag_SearchStep> vSteps;

    bool IsKeypad() const { return strType == "num"; }
};

// For people: the matched characters in colour, or in brackets.
void PrintSearchText(std::ostream& stream, const tag_SearchReport& report, bool bColor);

// For pipes: the last step's matches, a line each, of the contact's id, a tab and its name.
void PrintSearchPlain(std::ostream& stream, const tag_SearchReport& report);

// One JSON document for programs, which `qvlocalize search --help` describes.
void PrintSearchJson(std::ostream& stream, const tag_SearchReport& report);

// Parts of both forms. The marks around the matched characters of a name, and whether the name is
// escaped for people.
struct tag_Marking
{
    const char* szBegin;
    const char* szEnd;
    bool bPrintable;
};
constexpr tag_Marking EXACT_MARKING = {"[", "]", false};
// An empty text (nothing typed) marks nothing.
std::string MarkedName(const tag_FoundContact& contact, const tag_SearchStep& step,
                       const tag_Marking& marking = EXACT_MARKING);
// Index of the first and the last matched character.
int FirstMatched(const tag_LocalizerDetail& detail);
int LastMatched(const tag_LocalizerDetail& detail);
// The keys of a mask: letters, or the digits of a keypad, and "#" for digits and other characters.
std::vector<std::string> NextKeys(uint32_t uMask, bool bKeypad);

#endif
