#ifndef QV_PLATFORM_LOGSINK_H
#define QV_PLATFORM_LOGSINK_H

// Where the stand-in log's lines go: tests read them, the tool silences or prints them.

// One line: its priority (3 debug, 6 error), tag and formatted text, valid during the call.
using LogSinkFn = void (*)(void* pContext, int iPriority, const char* szTag, const char* szText);

// The one sink of the process.
class __attribute__((visibility("default"))) CLogSink
{
public:
    // Sends all following lines to pfnSink, which gets pContext with each; null restores the
    // default. Not synchronised: set it while no other thread logs.
    static void Set(LogSinkFn pfnSink, void* pContext);
};

#endif
