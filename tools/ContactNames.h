#ifndef QV_TOOLS_CONTACTNAMES_H
#define QV_TOOLS_CONTACTNAMES_H

#include "Core/Records/SearchRecords.h"

#include <functional>
#include <string>

// The name, in UTF-8, to show for an entry of a result set, which carries only an id and codes.
using ContactNameLookup = std::function<std::string(const tag_LocalizerDetail&)>;

// Looks the contact up in the provider's database, since the store keeps pinyin keys, not names.
// The name is empty if the contact has none or was deleted. Throws CToolError.
ContactNameLookup LookUpInDatabase();

// Reads the name back from the codes of the entry; fits the special numbers, whose codes are all
// Chinese characters. Throws CToolError when the pinyin table cannot be opened.
ContactNameLookup LookUpByCodes();

#endif
