#ifndef QV_TOOLS_SAMPLECONTACTS_H
#define QV_TOOLS_SAMPLECONTACTS_H

#include <cstdint>
#include <string>
#include <vector>

// Groups and accounts of the sample are numbered from 1.
constexpr int SAMPLE_GROUPS = 6;
constexpr int SAMPLE_ACCOUNTS = 4;

// One contact of the sample, as the provider's tables hold it.
struct tag_SampleContact
{
    int64_t llID = 0;
    std::string strName;     // UTF-8, may be empty
    std::string strKey;      // localizer codes in UTF-8
    std::string strGroups;   // decimal ids separated by "."
    std::string strAccounts; // decimal ids separated by "."
    bool bVisible = true;
    bool bSecret = false;
    bool bStarred = false;
    bool bPhone = false;
    bool bMail = false;
    bool bAddress = false;
    int64_t llLastTimeContacted = 0; // milliseconds since 1970; 0 for never
    int iTimesContacted = 0;
    int64_t llStatusUpdateID = 0; // 0 for none
    std::string strStatus;        // of the status update; empty for none
};

// iCount contacts with names of every kind (simplified, traditional, polyphonic, Latin, mixed,
// digits, none) and every attribute that a filter asks for. The same count and time always give
// the same contacts; the times of last contact go back from llNow.
std::vector<tag_SampleContact> MakeSampleContacts(int iCount, int64_t llNow);

#endif
