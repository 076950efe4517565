#include "tools/RecordText.h"

#include "tools/PrintableText.h"
#include "tools/Utf8Text.h"

#include <ctime>
#include <cwchar>
#include <iomanip>
#include <iterator>
#include <ostream>
#include <sstream>

namespace
{

constexpr int PLACE_WIDTH = 6;
constexpr int ID_WIDTH = 9;
constexpr int FLAGS_WIDTH = 8;
constexpr int TIME_WIDTH = 18;
constexpr int LIST_WIDTH = 14;
constexpr int MS_PER_SECOND = 1000;
constexpr size_t TIME_BUFFER = 32;

struct tag_FlagLetter
{
    uint32_t uFlag;
    char chLetter;
    const char* szMeaning;
};

constexpr tag_FlagLetter FLAG_LETTERS[] = {
    {CONTACT_FLAG_SECRET, 's', "secret"},   {CONTACT_FLAG_MAIL, 'm', "mail address"},
    {CONTACT_FLAG_PHONE, 'p', "phone"},     {CONTACT_FLAG_STARRED, '*', "favourite"},
    {CONTACT_FLAG_ADDRESS, 'a', "address"}, {CONTACT_FLAG_ONLINE, 'o', "online"},
};

std::string FlagsLegend()
{
    std::string strText;
    for (const tag_FlagLetter& flag : FLAG_LETTERS)
    {
        strText += strText.empty() ? "" : ", ";
        strText += flag.chLetter;
        strText += std::string(" ") + flag.szMeaning;
    }
    return strText;
}

std::string FlagsText(uint32_t uFlags)
{
    std::string strText;
    for (const tag_FlagLetter& flag : FLAG_LETTERS)
    {
        strText += (uFlags & flag.uFlag) != 0 ? flag.chLetter : '-';
    }
    return strText;
}

std::string TimeText(int64_t llMilliseconds)
{
    if (llMilliseconds == 0)
    {
        return "never";
    }
    const std::time_t tSeconds = static_cast<std::time_t>(llMilliseconds / MS_PER_SECOND);
    std::tm parts = {};
    char szText[TIME_BUFFER] = "?";
    if (gmtime_r(&tSeconds, &parts) != nullptr)
    {
        std::strftime(szText, sizeof(szText), "%Y-%m-%d %H:%M", &parts);
    }
    return szText;
}

std::string ListText(const QVLong32* plIDs, int iMax)
{
    std::string strText;
    for (int i = 0; i < iMax && plIDs[i] != 0; ++i)
    {
        strText += (i == 0 ? "" : ".") + std::to_string(plIDs[i]);
    }
    return strText.empty() ? "-" : strText;
}

std::string SpellingText(const tag_ContactsStruct& record)
{
    if (record.szName[0] == NAME_EMPTY_MARK)
    {
        return "(no name)";
    }
    // A damaged record may lack the terminator.
    return PrintableText(
        Utf8Text({record.szName, wcsnlen(record.szName, std::size(record.szName))}));
}

std::string CodesText(const tag_ContactsStruct& record)
{
    std::ostringstream text;
    for (int i = 0; i < CONTACT_MAX_KEY && record.szLocalizerKey[i] != 0; ++i)
    {
        text << (i == 0 ? "  {" : " ") << std::hex
             << static_cast<uint32_t>(record.szLocalizerKey[i]);
    }
    return text.str().empty() ? "" : text.str() + "}";
}

} // namespace

void PrintRecordHeading(std::ostream& stream)
{
    stream << "  place     in name order, from 0\n"
              "  flags     "
           << FlagsLegend()
           << "\n"
              "  spelling  what the records are sorted by: each reading with its character\n"
              "  codes     what searches look at, one for each character of the name\n";
    stream << std::right << std::setw(PLACE_WIDTH) << "place" << std::setw(ID_WIDTH) << "contact"
           << "  " << std::left << std::setw(FLAGS_WIDTH) << "flags" << std::setw(TIME_WIDTH)
           << "last contact" << std::setw(LIST_WIDTH) << "groups" << std::setw(LIST_WIDTH)
           << "accounts"
           << "spelling {codes}\n";
}

void PrintRecord(std::ostream& stream, const tag_ContactsStruct& record)
{
    stream << std::right << std::setw(PLACE_WIDTH) << record.iSortIndex << std::setw(ID_WIDTH)
           << record.iContactID << "  " << std::left << std::setw(FLAGS_WIDTH)
           << FlagsText(record.iFlags) << std::setw(TIME_WIDTH)
           << TimeText(record.llLastTimeContacted) << std::setw(LIST_WIDTH)
           << ListText(record.lGroupID, CONTACT_MAX_GROUPS) << std::setw(LIST_WIDTH)
           << ListText(record.lAccountID, CONTACT_MAX_ACCOUNTS) << SpellingText(record)
           << CodesText(record) << '\n';
}
