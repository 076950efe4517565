#ifndef QV_COMMON_WIDESTRING_H
#define QV_COMMON_WIDESTRING_H

#include "Common/Export.h"

#include <cstddef>

// Strings of 32-bit units ended by a 0 unit, and a few calls on bytes. All lengths are counted in
// units and leave out the terminator. Every call is reentrant and allocates nothing; none but
// strupr depends on the locale. Pointers are not null except where a call says what null does.
extern "C"
{
    // The number of units before the terminator.
    QV_EXPORT size_t _wcslen(const wchar_t* szText);

    // Copy szSource with its terminator to szTarget, which must have room; return szTarget. Null
    // on either side: nothing is copied.
    QV_EXPORT wchar_t* _wcscpy(wchar_t* szTarget, const wchar_t* szSource);

    // Copies at most uCount units and fills the rest of the uCount units with 0. A szSource of
    // uCount units or more leaves szTarget without a terminator. Returns szTarget; null on either
    // side: nothing is copied.
    QV_EXPORT wchar_t* _wcsncpy(wchar_t* szTarget, const wchar_t* szSource, size_t uCount);

    // Appends szSource to szTarget, which must have room; returns szTarget. Null on either side:
    // nothing is appended.
    QV_EXPORT wchar_t* _wcscat(wchar_t* szTarget, const wchar_t* szSource);

    // 0 when equal, else the first units that differ, left - right. The difference wraps at 32
    // bits, so units with more than 2^31 between them compare the wrong way round.
    QV_EXPORT int _wcscmp(const wchar_t* szLeft, const wchar_t* szRight);
    QV_EXPORT int _wcsncmp(const wchar_t* szLeft, const wchar_t* szRight, size_t uCount);

    // Change the case of ASCII letters and of nothing else; the string forms work in place and
    // return szText.
    QV_EXPORT wchar_t _towlower(wchar_t cUnit);
    QV_EXPORT wchar_t _towupr(wchar_t cUnit);
    QV_EXPORT wchar_t* _wcslwr(wchar_t* szText);
    QV_EXPORT wchar_t* _wcsupr(wchar_t* szText);

    // Compares in the order of code units over the longer of the two lengths: 1 when szLeft comes
    // first, 2 when they are equal, 3 when szRight comes first. The lengths are those of the
    // strings; iLocale and iFlags change nothing.
    QV_EXPORT int _CompareString(int iLocale, int iFlags, const wchar_t* szLeft, int iLeftLength,
                                 const wchar_t* szRight, int iRightLength);

    // --- For callers outside: nothing in the library calls these ---

    // First occurrence of szKey in szText, szText itself for an empty szKey, null when it does
    // not occur or either is null.
    QV_EXPORT const wchar_t* _wcsstr(const wchar_t* szText, const wchar_t* szKey);

    // Uppercases a byte string in place with the C library's toupper; returns szText.
    QV_EXPORT char* strupr(char* szText);

    // Copies uSize bytes as if one at a time from the first to the last: where the target starts
    // inside the source, the bytes before it repeat. Returns pTarget; null, with nothing copied,
    // when either is null.
    QV_EXPORT void* _memcpy(void* pTarget, const void* pSource, size_t uSize);
}

#endif
