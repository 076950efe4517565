#ifndef QV_TOOLS_IMPORTENTRY_H
#define QV_TOOLS_IMPORTENTRY_H

#include <optional>
#include <string>
#include <vector>

// One contact of a JSON line. What the line does not mention has no value.
struct tag_ImportEntry
{
    long lLine = 0;        // where it stands in the file that people know
    std::string strReason; // why it cannot be taken; empty when it can
    std::string strName;   // UTF-8, never empty in an entry that can be taken
    std::string strUid;    // empty for none
    std::optional<bool> bPhone;
    std::optional<bool> bMail;
    std::optional<bool> bAddress;
    std::optional<bool> bStarred;
    std::optional<std::vector<std::string>> vGroups;
};

// Reads the line with this number; the manual page tells its form.
tag_ImportEntry ReadImportEntry(const std::string& strLine, long lLine);

#endif
