#ifndef QV_CORE_RECORDS_LOCALIZERCODES_H
#define QV_CORE_RECORDS_LOCALIZERCODES_H

// The codes of names and the record of the pinyin table, apart from the sorter and the localizer,
// so that neither needs the other.

#include <cstddef>
#include <cstdint>

// Result codes of the localizer.
constexpr int LOC_ERR_MAP = -1000;   // the pinyin table cannot be built, opened or searched
constexpr int LOC_ERR_PARAM = -1005; // a missing argument, or an input that is too long

// Codes: one per character of a name, LOC_NO_CODE ends the array.
constexpr wchar_t LOC_NO_CODE = 0;
constexpr wchar_t LOC_HANZI_BASE = 0x1000; // + record of the pinyin table
constexpr wchar_t LOC_ALPHA_BASE = 0x4F00; // + place in the alphabet, case not kept
constexpr wchar_t LOC_OTHER = 0x5000;      // space, punctuation, characters not in the table
constexpr wchar_t LOC_DIGIT_BASE = 0x5A00; // + value of the digit
constexpr int LOC_ALPHA_COUNT = 26;
constexpr int LOC_DIGIT_COUNT = 10;

constexpr int PY_WORD_COUNT = 15422; // characters of the pinyin table
constexpr int PY_READINGS = 3;       // readings of one character, at most
constexpr int PY_MAX_LETTERS = 6;    // letters of one reading, at most

// One character of the pinyin table: UTF-8 and ASCII text, every string zero-terminated inside
// its slot and the rest of the slot zero. Unused readings are empty.
struct PYOFWORDS
{
    char szWord[4];                                    // the character
    char szPinyin[PY_READINGS][PY_MAX_LETTERS + 1];    // its readings, without tone, v for u-umlaut
    char szPinyinNum[PY_READINGS][PY_MAX_LETTERS + 1]; // the same as keypad digits
};
static_assert(sizeof(PYOFWORDS) == 46, "the record is the file");
static_assert(offsetof(PYOFWORDS, szPinyin) == 4, "file layout");
static_assert(offsetof(PYOFWORDS, szPinyinNum) == 25, "file layout");

// Bytes of a record and of the table's file.
constexpr int PY_RECORD_SIZE = static_cast<int>(sizeof(PYOFWORDS));
constexpr int PY_FILE_SIZE = PY_WORD_COUNT * PY_RECORD_SIZE;
static_assert(PY_FILE_SIZE == 709412, "the table is the file");

// Classes of codes, by the low 16 bits of a code.
constexpr bool IsGBIndex(uint16_t uIndex)
{
    return uIndex < PY_WORD_COUNT;
}
constexpr bool IsHanZiCode(uint16_t uCode)
{
    return IsGBIndex(static_cast<uint16_t>(uCode - LOC_HANZI_BASE));
}
constexpr bool IsAlphaCode(uint16_t uCode)
{
    return static_cast<uint16_t>(uCode - LOC_ALPHA_BASE) < LOC_ALPHA_COUNT;
}
constexpr bool IsDigitCode(uint16_t uCode)
{
    return static_cast<uint16_t>(uCode - LOC_DIGIT_BASE) < LOC_DIGIT_COUNT;
}

// The low 16 bits of a code, which alone give its class and its record.
constexpr uint16_t CodeBits(wchar_t code)
{
    return static_cast<uint16_t>(code);
}

// The record of a Chinese code; below PY_WORD_COUNT whenever IsHanZiCode holds.
constexpr int HanZiRecord(wchar_t code)
{
    return static_cast<uint16_t>(CodeBits(code) - LOC_HANZI_BASE);
}

#endif
