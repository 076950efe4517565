#ifndef QV_COMMON_NUMBERTEXT_H
#define QV_COMMON_NUMBERTEXT_H

#include "Common/Export.h"

// Numbers to text and back. Reentrant, independent of the locale.

// The bases that numbers are written in.
constexpr int NUMBER_MIN_RADIX = 2;
constexpr int NUMBER_MAX_RADIX = 36;

extern "C"
{
    // --- For callers outside: nothing in the library calls these ---

    // Value of the decimal digits at the start of szText, which is not null: no blanks, no sign;
    // 0 without digits. Wraps at 32 bits.
    QV_EXPORT int _atoi(const wchar_t* szText);

    // Text of iValue with digits above 9 as 'a'..'z', zero-terminated, in szBuffer (33 bytes are
    // always enough) or, when that is null, in memory of exactly the needed size that the caller
    // releases with free. A minus sign only in radix 10; other radices show the 32 bits as an
    // unsigned number. Returns the text; null for a radix outside 2..36 or if malloc fails.
    QV_EXPORT char* itoa(int iValue, char* szBuffer, int iRadix);

    // Text of ulValue with digits above 9 as 'A'..'Z', zero-terminated, in szBuffer: one byte per
    // bit of a long and one more are always enough. iRadix is 2..36 and not checked.
    QV_EXPORT void _ultoa(unsigned long ulValue, char* szBuffer, int iRadix);

    // As _ultoa, but a negative lValue in radix 10 is a minus sign and the magnitude.
    QV_EXPORT void _ltoa(long lValue, char* szBuffer, int iRadix);
}

#endif
