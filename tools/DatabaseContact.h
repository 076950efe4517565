#ifndef QV_TOOLS_DATABASECONTACT_H
#define QV_TOOLS_DATABASECONTACT_H

#include <cstdint>
#include <string>

// One contact as the provider's tables hold it. What is not set is what most contacts have.
struct tag_DatabaseContact
{
    int64_t llID = 0;
    std::string strName{};           // UTF-8, may be empty
    std::string strKey{};            // localizer codes in UTF-8
    std::string strGroups{};         // decimal ids separated by "."
    std::string strAccounts{};       // decimal ids separated by "."
    int64_t llLastTimeContacted = 0; // milliseconds since 1970; 0 for never
    int iTimesContacted = 0;
    int64_t llStatusUpdateID = 0; // 0 for none
    std::string strStatus{};      // of the status update; empty for none
    bool bVisible = true;
    bool bSecret = false;
    bool bStarred = false;
    bool bPhone = false;
    bool bMail = false;
    bool bAddress = false;
};

#endif
