#ifndef QV_COMMON_LOG_H
#define QV_COMMON_LOG_H

#include <android/log.h>

// Priorities of the platform's log that the library writes with.
constexpr int QV_LOG_DEBUG = 3;
constexpr int QV_LOG_ERROR = 6;

// The tag of every line that names no other.
constexpr const char* QV_LOG_TAG = "QV_Localize";

// Macros, so that the compiler checks each format against its arguments.
#define QV_LOGD(szTag, ...) __android_log_print(QV_LOG_DEBUG, szTag, __VA_ARGS__)
#define QV_LOGE(szTag, ...) __android_log_print(QV_LOG_ERROR, szTag, __VA_ARGS__)

#endif
