#include "Common/SystemTime.h"

#include <chrono>
#include <ctime>
#include <sys/time.h>
#include <thread>

namespace
{

constexpr int MICROS_PER_MILLI = 1000;
constexpr int MICROS_PER_SECOND = 1000000;
constexpr int FIRST_YEAR = 1900; // that a broken-down time counts from

timeval WallClock()
{
    timeval now = {};
    gettimeofday(&now, nullptr);
    return now;
}

// localtime into the caller's memory; like it, this reads the time zone each time.
bool BreakDown(time_t seconds, tm& fields)
{
    tzset();
    return localtime_r(&seconds, &fields) != nullptr;
}

void FillCalendar(const tm& fields, tag_SystemTime& time)
{
    time.year = static_cast<uint16_t>(fields.tm_year + FIRST_YEAR);
    time.month = static_cast<uint16_t>(fields.tm_mon + 1);
    time.dayOfWeek = static_cast<uint16_t>(fields.tm_wday);
    time.day = static_cast<uint16_t>(fields.tm_mday);
    time.hour = static_cast<uint16_t>(fields.tm_hour);
    time.minute = static_cast<uint16_t>(fields.tm_min);
    time.second = static_cast<uint16_t>(fields.tm_sec);
}

} // namespace

int32_t GetTickCount()
{
    const timeval now = WallClock();
    const int64_t llMicros = static_cast<int64_t>(now.tv_sec) * MICROS_PER_SECOND + now.tv_usec;
    return static_cast<int32_t>(static_cast<uint32_t>(llMicros / MICROS_PER_MILLI));
}

void Sleep(unsigned int uMilliseconds)
{
    std::this_thread::sleep_for(std::chrono::milliseconds(uMilliseconds));
}

void GetLocalTime(tag_SystemTime* pTime)
{
    tm fields = {};
    if (pTime == nullptr || !BreakDown(time(nullptr), fields))
    {
        return;
    }
    FillCalendar(fields, *pTime);
    pTime->milliseconds = static_cast<uint16_t>(WallClock().tv_usec / MICROS_PER_MILLI);
}

int SystemTimeToFileTime(const tag_SystemTime* pTime, tag_FileTime* pFileTime)
{
    if (pTime == nullptr || pFileTime == nullptr)
    {
        return 1;
    }
    tm fields = {};
    fields.tm_year = pTime->year - FIRST_YEAR;
    fields.tm_mon = pTime->month - 1;
    fields.tm_mday = pTime->day;
    fields.tm_hour = pTime->hour;
    fields.tm_min = pTime->minute;
    fields.tm_sec = pTime->second;
    fields.tm_wday = pTime->dayOfWeek;
    const int64_t llSeconds = mktime(&fields);
    const bool bFits = llSeconds >= INT32_MIN && llSeconds <= INT32_MAX;
    pFileTime->seconds = bFits ? static_cast<int32_t>(llSeconds) : -1;
    pFileTime->milliseconds = pTime->milliseconds;
    return 1;
}

int FileTimeToSystemTime(const tag_FileTime* pFileTime, tag_SystemTime* pTime)
{
    tm fields = {};
    if (pFileTime == nullptr || pTime == nullptr || !BreakDown(pFileTime->seconds, fields))
    {
        return 1;
    }
    FillCalendar(fields, *pTime);
    pTime->milliseconds = static_cast<uint16_t>(pFileTime->milliseconds);
    return 1;
}
