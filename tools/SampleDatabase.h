#ifndef QV_TOOLS_SAMPLEDATABASE_H
#define QV_TOOLS_SAMPLEDATABASE_H

#include "tools/SampleContacts.h"

#include <string>
#include <vector>

// Makes a provider database of the contacts at strPath, in place of what stands there. The file
// appears whole or not at all. Throws CToolError.
void WriteSampleDatabase(const std::string& strPath,
                         const std::vector<tag_SampleContact>& vContacts);

#endif
