#ifndef QV_COMMON_SYSTEMTIME_H
#define QV_COMMON_SYSTEMTIME_H

#include "Common/Export.h"

#include <cstddef>
#include <cstdint>

// A calendar time in the device's time zone.
struct tag_SystemTime
{
    uint16_t year;         // in full, not counted from 1900
    uint16_t month;        // 1..12
    uint16_t dayOfWeek;    // 0 = Sunday .. 6 = Saturday
    uint16_t day;          // 1..31
    uint16_t hour;         // 0..23
    uint16_t minute;       // 0..59
    uint16_t second;       // 0..60
    uint16_t milliseconds; // 0..999
};
static_assert(sizeof(tag_SystemTime) == 16, "part of the interface");
static_assert(offsetof(tag_SystemTime, dayOfWeek) == 4, "part of the interface");

// A point in time.
struct tag_FileTime
{
    uint32_t milliseconds; // 0..999, added to the seconds
    int32_t seconds;       // since 1970-01-01 00:00 UTC; signed, as a 32-bit time_t is
};
static_assert(sizeof(tag_FileTime) == 8, "part of the interface");
static_assert(offsetof(tag_FileTime, seconds) == 4, "part of the interface");

// Reentrant, without state. A null argument: nothing is done.
extern "C"
{
    // The low 32 bits of the wall clock in milliseconds, one clock reading. Only the difference
    // of two readings means anything, and it is taken unsigned, since the count wraps.
    QV_EXPORT int32_t GetTickCount();

    // Pauses the calling thread for the whole time, whatever signals it handles meanwhile.
    QV_EXPORT void Sleep(unsigned int uMilliseconds);

    // --- For callers outside: nothing in the library calls these ---

    // The wall clock as a calendar time.
    QV_EXPORT void GetLocalTime(tag_SystemTime* pTime);

    // Between calendar and point in time; always 1. A calendar time is taken as standard time,
    // without daylight saving, and its dayOfWeek is ignored. The seconds are a field of 32 bits: of
    // a calendar time before December 1901 or after January 2038, which does not fit, they become
    // -1, also where the C library counts in 64 bits. A point in time without a calendar form
    // leaves pTime untouched.
    QV_EXPORT int SystemTimeToFileTime(const tag_SystemTime* pTime, tag_FileTime* pFileTime);
    QV_EXPORT int FileTimeToSystemTime(const tag_FileTime* pFileTime, tag_SystemTime* pTime);
}

#endif
