#ifndef QV_BINDINGS_UTF8TEXT_H
#define QV_BINDINGS_UTF8TEXT_H

// UTF-8 of any Unicode characters, one 32-bit unit per character. Common/Utf8.h stops at U+FFFF and
// is lenient; callers from other languages get neither.

#include <cstddef>

// Bytes of one character at most.
constexpr size_t UTF8_MAX_BYTES = 4;

// Decodes the first iMaxUnits characters of szText into szTarget, which has room for them and a
// terminator, and checks all of it. Returns how many characters szText has, counting no further
// than INT_MAX, or -1 when it is malformed, overlong, a surrogate or beyond U+10FFFF.
int DecodeText(const char* szText, wchar_t* szTarget, int iMaxUnits);

// Encodes szText into szTarget, which has uSize bytes, with a terminator; false with nothing
// written when it has no room.
bool EncodeText(const wchar_t* szText, char* szTarget, size_t uSize);

#endif
