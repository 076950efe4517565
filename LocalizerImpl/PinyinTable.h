#ifndef QV_LOCALIZERIMPL_PINYINTABLE_H
#define QV_LOCALIZERIMPL_PINYINTABLE_H

#include "Core/Records/LocalizerCodes.h"

#include <cstring>

// The mapped pinyin table for the length of a scope.
class CPinyinTable
{
public:
    CPinyinTable();
    ~CPinyinTable();
    CPinyinTable(const CPinyinTable&) = delete;
    CPinyinTable& operator=(const CPinyinTable&) = delete;

    bool IsOpen() const { return m_pRecords != nullptr; }
    // The first record; null when the table could not be mapped.
    PYOFWORDS* Records() const { return m_pRecords; }

private:
    PYOFWORDS* m_pRecords = nullptr;
};

// Length of a spelling, which in a damaged table may fill its slot without a terminator.
inline int SpellingLength(const char (&szSpelling)[PY_MAX_LETTERS + 1])
{
    return static_cast<int>(strnlen(szSpelling, sizeof(szSpelling)));
}

// The character of a record as one wide character, 0 when it does not decode.
wchar_t RecordCharacter(const PYOFWORDS& record);

#endif
