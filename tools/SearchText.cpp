#include "tools/PrintableText.h"
#include "tools/SearchReport.h"

#include <iomanip>
#include <ostream>

namespace
{

constexpr tag_Marking PLAIN_MARKING = {"[", "]", true};
constexpr tag_Marking COLOR_MARKING = {"\033[1;31m", "\033[0m", true};
constexpr int NUMBER_WIDTH = 5;
constexpr int ID_WIDTH = 6;

void PrintFilters(std::ostream& stream, const tag_SearchReport& report)
{
    const char* szBefore = "; filters: ";
    for (const tag_ChosenFilter& filter : report.vFilters)
    {
        stream << szBefore << filter.strName;
        if (filter.bHasID)
        {
            stream << ' ' << filter.iID;
        }
        szBefore = ", ";
    }
}

void PrintHeading(std::ostream& stream, const tag_SearchReport& report)
{
    stream << "Search \"" << PrintableText(report.strInput) << "\" (" << report.strType << ", "
           << (report.bNarrow ? "each key narrows the matches before it"
                              : "each key searches the whole index");
    PrintFilters(stream, report);
    stream << ")\n";
}

void PrintContact(std::ostream& stream, const tag_SearchStep& step, const tag_FoundContact& contact,
                  int iRank, bool bColor)
{
    stream << std::setw(NUMBER_WIDTH) << iRank << ".  contact " << std::left << std::setw(ID_WIDTH)
           << contact.detail.iContactID << std::right << ' ';
    if (contact.detail.iFirstWord != 0)
    {
        stream << static_cast<char>(contact.detail.iFirstWord) << "  ";
    }
    if (contact.strName.empty())
    {
        stream << "(no name)\n";
        return;
    }
    stream << MarkedName(contact, step, bColor ? COLOR_MARKING : PLAIN_MARKING) << '\n';
}

void PrintContacts(std::ostream& stream, const tag_SearchStep& step, bool bColor)
{
    int iRank = 0;
    for (const tag_FoundContact& contact : step.vBest)
    {
        PrintContact(stream, step, contact, ++iRank, bColor);
    }
    if (step.iTotal > iRank)
    {
        stream << std::setw(NUMBER_WIDTH) << "..."
               << "   and " << step.iTotal - iRank << " more\n";
    }
}

void PrintSections(std::ostream& stream, const tag_SearchStep& step)
{
    if (step.vSections.empty())
    {
        return;
    }
    const char* szBefore = "   sections: ";
    for (const tag_Section& section : step.vSections)
    {
        stream << szBefore << section.strLabel << ' ' << section.iContacts;
        szBefore = ", ";
    }
    stream << '\n';
}

void PrintWords(std::ostream& stream, const char* szLabel, const std::vector<std::string>& vWords)
{
    stream << szLabel;
    for (const std::string& strWord : vWords)
    {
        stream << ' ' << PrintableText(strWord);
    }
    stream << (vWords.empty() ? " none\n" : "\n");
}

// A digit search reports the first keys of a next character, not the next keys of the last one.
void PrintNextKeys(std::ostream& stream, const tag_SearchStep& step, bool bKeypad)
{
    PrintWords(stream,
               bKeypad ? "   keys that may begin the next character:" : "   keys that may follow:",
               NextKeys(step.uMask, bKeypad));
}

void PrintStep(std::ostream& stream, const tag_SearchStep& step, bool bKeypad, bool bColor)
{
    stream << "\n> " << PrintableText(step.strTyped) << "_   " << step.iTotal
           << (step.iTotal == 1 ? " match\n" : " matches\n");
    PrintContacts(stream, step, bColor);
    PrintSections(stream, step);
    PrintNextKeys(stream, step, bKeypad);
    if (!step.vCandidates.empty())
    {
        PrintWords(stream, "   characters to pick: ", step.vCandidates);
    }
}

} // namespace

void PrintSearchText(std::ostream& stream, const tag_SearchReport& report, bool bColor)
{
    PrintHeading(stream, report);
    for (const tag_SearchStep& step : report.vSteps)
    {
        PrintStep(stream, step, report.IsKeypad(), bColor);
    }
}

void PrintSearchPlain(std::ostream& stream, const tag_SearchReport& report)
{
    for (const tag_FoundContact& contact : report.vSteps.back().vBest)
    {
        stream << contact.detail.iContactID << '\t' << PrintableText(contact.strName) << '\n';
    }
}
