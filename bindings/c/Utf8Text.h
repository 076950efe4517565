#ifndef QV_BINDINGS_UTF8TEXT_H
#define QV_BINDINGS_UTF8TEXT_H

// UTF-8 of any Unicode characters, one 32-bit unit per character. Unlike Common/Utf8.h it goes
// beyond U+FFFF and refuses overlong forms and surrogates.

#include <cstddef>

// Bytes of one character at most.
constexpr size_t UTF8_MAX_BYTES = 4;

// Decodes the first iMaxUnits characters of szText into szTarget, which has room for them and a
// terminator, and checks all of szText. Returns how many characters it has, at most INT_MAX, or -1
// if one is malformed, overlong, a surrogate or beyond U+10FFFF.
int DecodeText(const char* szText, wchar_t* szTarget, int iMaxUnits);

// Encodes szText with a terminator into szTarget, which has uSize bytes; false with nothing written
// if it does not fit.
bool EncodeText(const wchar_t* szText, char* szTarget, size_t uSize);

#endif
