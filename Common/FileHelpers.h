#ifndef QV_COMMON_FILEHELPERS_H
#define QV_COMMON_FILEHELPERS_H

#include "Common/Export.h"

extern "C"
{
    // --- For callers outside: nothing in the library calls these ---

    // Writes the absolute path of the file that this library was loaded from to szPath: at most
    // the path's bytes with an index up to iLastByte, decoded from UTF-8 as _mbstowcs does, without
    // a terminator (clear szPath beforehand; iLastByte + 2 units are enough). hModule is ignored.
    // 0, or -1 when the file is not found: no list of mappings, a line of that list above 1023
    // bytes, a null szPath.
    QV_EXPORT int GetModuleFileName(void* hModule, wchar_t* szPath, int iLastByte);

    // Move or delete with the shell's "mv" and "rm -r" (directories go with all they hold) and
    // wait for the command; always 1, whether it succeeded or not. Paths of any length are quoted:
    // the shell takes blanks, quotes, $ and a leading dash as parts of a name. The command is not
    // run for a null path or if the allocation fails.
    QV_EXPORT int _MoveFile(const char* szSource, const char* szTarget);
    QV_EXPORT int _DeleteFile(const char* szPath);

    // The same for wide paths. A unit that Unicode2Utf8 cannot encode becomes U+FFFD.
    QV_EXPORT int _wc_MoveFile(const wchar_t* szSource, const wchar_t* szTarget);
    QV_EXPORT int _wc_DeleteFile(const wchar_t* szPath);
}

#endif
