#include "Platform/LogSink.h"

#include <android/log.h>
#include <cstdarg>
#include <cstdio>

namespace
{

constexpr int ERROR_PRIORITY = 6;
constexpr int MAX_LINE_BYTES = 4096;

LogSinkFn g_pfnSink = nullptr;
void* g_pSinkContext = nullptr;

void PrintToStandardError(const char* szTag, const char* szText)
{
    std::fprintf(stderr, "%s: %s\n", szTag, szText);
}

} // namespace

void CLogSink::Set(LogSinkFn pfnSink, void* pContext)
{
    g_pfnSink = pfnSink;
    g_pSinkContext = pContext;
}

int __android_log_print(int iPriority, const char* szTag, const char* szFormat, ...)
{
    // Debug lines stand in hot loops: a line that is dropped is not formatted.
    if (g_pfnSink == nullptr && iPriority < ERROR_PRIORITY)
    {
        return 0;
    }
    char szText[MAX_LINE_BYTES];
    va_list args;
    va_start(args, szFormat);
    std::vsnprintf(szText, sizeof(szText), szFormat, args);
    va_end(args);
    if (g_pfnSink != nullptr)
    {
        g_pfnSink(g_pSinkContext, iPriority, szTag, szText);
    }
    else
    {
        PrintToStandardError(szTag, szText);
    }
    return 1;
}
