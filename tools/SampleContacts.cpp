#include "tools/SampleContacts.h"

#include "tools/SampleNames.h"

#include <iterator>

namespace
{

constexpr int64_t MINUTE_MS = 60LL * 1000;
constexpr int64_t DAY_MS = 24 * 60 * MINUTE_MS;
constexpr int64_t LONGEST_AGO_DAYS = 500;

constexpr const char* STATUS_TEXTS[] = {"online", "offline", "away", "online", "busy"};

// Ids with gaps, as after deletions.
int64_t IdOf(int iIndex)
{
    return 1 + iIndex + iIndex / 9;
}

// Group 1 holds every second contact, 2 every third, and so on, so that filters overlap.
std::string GroupsOf(int iIndex)
{
    std::string strGroups;
    for (int iGroup = 1; iGroup <= SAMPLE_GROUPS; ++iGroup)
    {
        if (iIndex % (iGroup + 1) == 0)
        {
            strGroups += (strGroups.empty() ? "" : ".") + std::to_string(iGroup);
        }
    }
    return strGroups;
}

// None, one or two accounts in turn.
std::string AccountsOf(int iIndex)
{
    const int iFirst = 1 + iIndex % SAMPLE_ACCOUNTS;
    const int iSecond = 1 + (iIndex + 1) % SAMPLE_ACCOUNTS;
    switch (iIndex % 5)
    {
    case 0:
        return "";
    case 1:
        return std::to_string(iFirst) + "." + std::to_string(iSecond);
    default:
        return std::to_string(iFirst);
    }
}

void SetFlags(tag_DatabaseContact& contact, int iIndex)
{
    contact.bVisible = iIndex % 17 != 16;
    contact.bSecret = iIndex % 23 == 5;
    contact.bStarred = iIndex % 11 == 0;
    contact.bPhone = iIndex % 5 != 4;
    contact.bMail = iIndex % 3 == 0;
    contact.bAddress = iIndex % 7 == 2;
}

void SetHistory(tag_DatabaseContact& contact, int iIndex, int64_t llNow)
{
    contact.iTimesContacted = iIndex * 7 % 40;
    if (contact.iTimesContacted > 0)
    {
        const int64_t llDays = iIndex * 37LL % LONGEST_AGO_DAYS;
        contact.llLastTimeContacted = llNow - llDays * DAY_MS - iIndex * MINUTE_MS;
    }
}

void SetStatus(tag_DatabaseContact& contact, int iIndex)
{
    if (iIndex % 4 == 1)
    {
        contact.llStatusUpdateID = 1000 + iIndex;
        contact.strStatus = STATUS_TEXTS[static_cast<size_t>(iIndex) / 4 % std::size(STATUS_TEXTS)];
    }
}

tag_DatabaseContact MakeContact(int iIndex, int64_t llNow)
{
    tag_DatabaseContact contact;
    contact.llID = IdOf(iIndex);
    contact.strName = SampleName(iIndex);
    contact.strGroups = GroupsOf(iIndex);
    contact.strAccounts = AccountsOf(iIndex);
    SetFlags(contact, iIndex);
    SetHistory(contact, iIndex, llNow);
    SetStatus(contact, iIndex);
    return contact;
}

} // namespace

std::vector<tag_DatabaseContact> MakeSampleContacts(int iCount, int64_t llNow)
{
    std::vector<tag_DatabaseContact> vContacts;
    vContacts.reserve(static_cast<size_t>(iCount));
    for (int i = 0; i < iCount; ++i)
    {
        vContacts.push_back(MakeContact(i, llNow));
    }
    return vContacts;
}
