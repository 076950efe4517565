#ifndef QV_COMMON_NAMEORDER_H
#define QV_COMMON_NAMEORDER_H

#include "Core/Records/ContactRecords.h"

// The name order of contact records: names by code units of their pinyin keys, with
// - a name that begins with a Latin letter before one that begins with a Chinese character when
//   the two keys begin with the same character;
// - then, from front to back: names, names that begin with a digit, with another character, and
//   contacts without a name.
// A szName without terminator is read to its field's end.

// The keys alone: negative, 0 or positive.
int CompareNameText(const tag_ContactsStruct& a, const tag_ContactsStruct& b);

// Whether a sorts after b.
bool NameSortsBehind(const tag_ContactsStruct& a, const tag_ContactsStruct& b);

#endif
