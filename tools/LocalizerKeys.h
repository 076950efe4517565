#ifndef QV_TOOLS_LOCALIZERKEYS_H
#define QV_TOOLS_LOCALIZERKEYS_H

#include "tools/SampleContacts.h"

#include <vector>

// Fills every contact's strKey as the provider does: makes the shared pinyin table, opens it
// once and asks the library for the codes of each name. Throws CToolError.
void FillLocalizerKeys(std::vector<tag_SampleContact>& vContacts);

#endif
