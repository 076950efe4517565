#ifndef QV_LOCALIZERIMPL_SYLLABLES_H
#define QV_LOCALIZERIMPL_SYLLABLES_H

#include "Common/Export.h"
#include "Core/Records/LocalizerCodes.h"

constexpr int PY_SYLLABLE_COUNT = 416; // entries of g_pyWords

// The syllables that letters can spell, lowercase, ascending, zero-padded. data/derive/syllables.py
// holds the same list for the checks of the data.
extern QV_EXPORT const wchar_t g_pyWords[PY_SYLLABLE_COUNT][PY_MAX_LETTERS + 1];

#endif
