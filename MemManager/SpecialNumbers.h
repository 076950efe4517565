#ifndef QV_MEMMANAGER_SPECIALNUMBERS_H
#define QV_MEMMANAGER_SPECIALNUMBERS_H

#include "Common/Export.h"
#include "Core/Records/SearchRecords.h"

constexpr int SPECIAL_NUMBER_COUNT = 7; // entries of g_specialNumberRecords

// The fixed entries that a search for special numbers looks through in place of the store: the
// keys of seven Chinese names, told apart by iContactID 0 to 6.
extern QV_EXPORT const tag_LocalizerDetail g_specialNumberRecords[SPECIAL_NUMBER_COUNT];

#endif
