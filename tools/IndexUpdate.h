#ifndef QV_TOOLS_INDEXUPDATE_H
#define QV_TOOLS_INDEXUPDATE_H

#include <string>
#include <vector>

class CDataDirectory;
class CLibraryLog;

struct tag_IndexPhase
{
    std::string strMeaning;
    int iMilliseconds;
};

// Builds the index of the directory's database, with a progress bar, and returns the build's
// phases. Throws CToolError.
std::vector<tag_IndexPhase> BuildIndex(const CDataDirectory& directory);

// Whether the last handler left the index complete: handlers return no result, but after a failure
// the registration record is marked.
bool IsIndexComplete();

// Shows how many contacts the index holds. Throws CToolError with the log's errors when it is not
// complete.
void PrintCompleteIndex(const CLibraryLog& log);

#endif
