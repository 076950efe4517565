#ifndef QV_MEMMANAGER_SPECIALNUMBERS_H
#define QV_MEMMANAGER_SPECIALNUMBERS_H

#include "Common/Export.h"
#include "Core/Records/SearchRecords.h"

constexpr int SPECIAL_NUMBER_COUNT = 7; // entries of g_specialNumberRecords

// The fixed candidate set of a search for special numbers: the keys of seven Chinese names, whose
// iContactID is 0 to 6.
extern QV_EXPORT const tag_LocalizerDetail g_specialNumberRecords[SPECIAL_NUMBER_COUNT];

#endif
