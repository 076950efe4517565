#ifndef QV_LOCALIZERIMPL_NAMEFOLDING_H
#define QV_LOCALIZERIMPL_NAMEFOLDING_H

#include "Common/Export.h"

constexpr int FOLDING_ROWS = 3755; // of the folding table

// Row r folds g_szTraditional[r] to g_szSimplified[r]; a character that stands in several rows
// folds by the first. Both arrays end with 0. Made from data/folding.tsv by the build.
extern QV_EXPORT const wchar_t g_szTraditional[FOLDING_ROWS + 1];
extern QV_EXPORT const wchar_t g_szSimplified[FOLDING_ROWS + 1];

extern "C"
{
    // Replaces the traditional characters among the first four of szText by their simplified
    // form, in place; the characters behind stay as they are. A null szText is left alone.
    QV_EXPORT void Ft2Jt(wchar_t* szText);
}

#endif
