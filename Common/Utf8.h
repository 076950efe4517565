#ifndef QV_COMMON_UTF8_H
#define QV_COMMON_UTF8_H

#include "Common/Export.h"

// Text between UTF-8 and 32-bit units, for characters up to U+FFFF. Reentrant, independent of the
// locale. The converters write no terminator: clear the target beforehand.

// What Utf82Unicode returns for bytes that it cannot decode.
constexpr int UTF8_ERR_INVALID = -201;

extern "C"
{
    // Decodes szSource up to its end; a character is taken only if its last byte has an index of
    // at most iLastByte, so szTarget needs room for iLastByte + 1 units. Returns the number of
    // units written, or UTF8_ERR_INVALID at the first character that is malformed, has four bytes
    // or more, or is cut by the bound; the units before it are written. Overlong forms and
    // surrogates are decoded like any other character. A null szSource or szTarget gives 0.
    QV_EXPORT int Utf82Unicode(const char* szSource, wchar_t* szTarget, int iLastByte);

    // Encodes the units of szSource with an index of at most iLastUnit, up to its end; returns the
    // number of bytes written, at most three per unit. A unit that is negative or above U+FFFF is
    // written as U+FFFD. A null szSource or szTarget gives 0.
    QV_EXPORT int Unicode2Utf8(const wchar_t* szSource, char* szTarget, int iLastUnit);

    // Utf82Unicode and Unicode2Utf8 with the target first.
    QV_EXPORT int _mbstowcs(wchar_t* szTarget, const char* szSource, int iLastByte);
    QV_EXPORT int _wcstombs(char* szTarget, const wchar_t* szSource, int iLastUnit);

    // --- For callers outside: nothing in the library calls these ---

    // Writes szFormat as it stands, in UTF-8, and a line end to standard output; the arguments
    // are ignored. Any length; a null szFormat writes the line end. Returns the number of bytes
    // written.
    QV_EXPORT int _wprintf(const wchar_t* szFormat, ...);

    // Formats by the rules of the narrow vsprintf (%s takes a narrow string) and decodes the
    // result into szTarget, which needs room for the decoded text and its terminator. A text that
    // does not decode ends before the offending character. Returns the formatted length in bytes
    // plus 1, or -1 with szTarget untouched when formatting or an allocation fails, the text has
    // 1024 bytes or more, or an argument is null.
    QV_EXPORT int _u_wsprintf(wchar_t* szTarget, const wchar_t* szFormat, ...);
}

#endif
