#ifndef QV_TOOLS_IMPORTENTRY_H
#define QV_TOOLS_IMPORTENTRY_H

#include <optional>
#include <string>
#include <vector>

// One contact of a JSON line. Members that the line does not mention have no value.
struct tag_ImportEntry
{
    long lLine = 0;        // in the file that the user named
    std::string strReason; // why it is refused; empty if it is valid
    std::string strName;   // UTF-8, never empty in a valid entry
    std::string strUid;    // empty for none
    std::optional<bool> bPhone;
    std::optional<bool> bMail;
    std::optional<bool> bAddress;
    std::optional<bool> bStarred;
    std::optional<std::vector<std::string>> vGroups;
};

// Reads the line with this number; the manual page describes its form.
tag_ImportEntry ReadImportEntry(const std::string& strLine, long lLine);

#endif
