#ifndef QV_PLATFORM_ANDROID_LOG_H
#define QV_PLATFORM_ANDROID_LOG_H

// Stands in for the platform's log where there is none. Each line goes to one sink, set with
// CLogSink of Platform/LogSink.h; without a sink, lines of priority error and above go to
// standard error and the others are dropped.

#ifdef __cplusplus
extern "C"
{
#endif

    // Formats one line and passes it to the sink. Returns 1, or 0 when the line was dropped.
    // Lines longer than 4095 bytes are cut.
    __attribute__((visibility("default"), format(printf, 3, 4))) int
    __android_log_print(int iPriority, const char* szTag, const char* szFormat, ...);

#ifdef __cplusplus
}
#endif

#endif
