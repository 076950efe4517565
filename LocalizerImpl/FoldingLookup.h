#ifndef QV_LOCALIZERIMPL_FOLDINGLOOKUP_H
#define QV_LOCALIZERIMPL_FOLDINGLOOKUP_H

// The code points that the lookup covers; the folding table changes no character outside.
constexpr unsigned FOLD_FIRST = 0x4E00;
constexpr unsigned FOLD_LAST = 0x9FFF;

// Element c - FOLD_FIRST is what the first row of the folding table whose traditional character is
// c folds it to, or 0 where c stays as it is: folding a character needs no search of the columns of
// NameFolding.h. Made from data/folding.tsv by the build.
extern const char16_t g_foldedCharacters[FOLD_LAST - FOLD_FIRST + 1];

#endif
