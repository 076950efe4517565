#include "Common/SystemTime.h"

#include <gtest/gtest.h>

#include <chrono>
#include <cstdlib>
#include <cstring>
#include <ctime>
#include <string>

namespace
{

// The process's time zone for as long as the object lives.
class CTimeZone
{
public:
    explicit CTimeZone(const char* szZone)
    {
        const char* szBefore = std::getenv("TZ");
        m_bSet = szBefore != nullptr;
        m_strBefore = m_bSet ? szBefore : "";
        setenv("TZ", szZone, 1);
        tzset();
    }
    ~CTimeZone()
    {
        m_bSet ? setenv("TZ", m_strBefore.c_str(), 1) : unsetenv("TZ");
        tzset();
    }
    CTimeZone(const CTimeZone&) = delete;
    CTimeZone& operator=(const CTimeZone&) = delete;

private:
    bool m_bSet;
    std::string m_strBefore;
};

constexpr const char* CENTRAL_EUROPE = "CET-1CEST,M3.5.0,M10.5.0/3";

bool SameTime(const tag_SystemTime& left, const tag_SystemTime& right)
{
    return std::memcmp(&left, &right, sizeof(left)) == 0;
}

} // namespace

TEST(SystemTime, PointsInTimeHaveTheirCalendarForm)
{
    const CTimeZone clZone(CENTRAL_EUROPE);
    struct
    {
        tag_FileTime point;
        tag_SystemTime calendar;
        int iDaylightSeconds; // that the calendar form is ahead of standard time
    } const cases[] = {
        {{0, 0}, {1970, 1, 4, 1, 1, 0, 0, 0}, 0},
        {{999, 1072911599}, {2003, 12, 3, 31, 23, 59, 59, 999}, 0},
        {{1, 1072911600}, {2004, 1, 4, 1, 0, 0, 0, 1}, 0},
        {{500, 1078009200}, {2004, 2, 0, 29, 0, 0, 0, 500}, 0},
        {{0, 1091354400}, {2004, 8, 0, 1, 12, 0, 0, 0}, 3600},
        {{0, -1}, {1970, 1, 4, 1, 0, 59, 59, 0}, 0},
        {{0, INT32_MAX}, {2038, 1, 2, 19, 4, 14, 7, 0}, 0},
    };
    for (const auto& item : cases)
    {
        tag_SystemTime calendar = {};
        EXPECT_EQ(1, FileTimeToSystemTime(&item.point, &calendar));
        EXPECT_TRUE(SameTime(item.calendar, calendar)) << item.point.seconds;
        tag_FileTime point = {7, 7};
        EXPECT_EQ(1, SystemTimeToFileTime(&calendar, &point));
        EXPECT_EQ(item.point.milliseconds, point.milliseconds);
        EXPECT_EQ(item.point.seconds + item.iDaylightSeconds, point.seconds);
    }
}

TEST(SystemTime, WhatDoesNotFitIsMinusOne)
{
    const CTimeZone clZone("UTC0");
    const tag_SystemTime beyond = {2200, 1, 0, 1, 0, 0, 0, 5};
    tag_FileTime point = {};
    EXPECT_EQ(1, SystemTimeToFileTime(&beyond, &point));
    EXPECT_EQ(-1, point.seconds);
    EXPECT_EQ(5U, point.milliseconds);
}

TEST(SystemTime, LocalTimeIsNow)
{
    const time_t before = time(nullptr);
    tag_SystemTime calendar = {};
    GetLocalTime(&calendar);
    const time_t after = time(nullptr);
    EXPECT_LE(calendar.milliseconds, 999);
    bool bFound = false;
    for (time_t second = before; second <= after; ++second)
    {
        const tag_FileTime point = {calendar.milliseconds, static_cast<int32_t>(second)};
        tag_SystemTime expected = {};
        FileTimeToSystemTime(&point, &expected);
        bFound = bFound || SameTime(expected, calendar);
    }
    EXPECT_TRUE(bFound);
}

TEST(SystemTime, NullDoesNothing)
{
    tag_SystemTime calendar = {};
    tag_FileTime point = {3, 4};
    GetLocalTime(nullptr);
    EXPECT_EQ(1, SystemTimeToFileTime(nullptr, &point));
    EXPECT_EQ(1, SystemTimeToFileTime(&calendar, nullptr));
    EXPECT_EQ(1, FileTimeToSystemTime(nullptr, &calendar));
    EXPECT_EQ(1, FileTimeToSystemTime(&point, nullptr));
    EXPECT_EQ(4, point.seconds);
    EXPECT_EQ(0, calendar.year);
}

TEST(SystemTime, TicksAreTheLowBitsOfTheWallClock)
{
    const auto Milliseconds = []
    {
        const auto now = std::chrono::system_clock::now().time_since_epoch();
        return static_cast<uint32_t>(
            std::chrono::duration_cast<std::chrono::milliseconds>(now).count());
    };
    const uint32_t uBefore = Milliseconds();
    const uint32_t uTicks = static_cast<uint32_t>(GetTickCount());
    const uint32_t uAfter = Milliseconds();
    EXPECT_LE(uTicks - uBefore, uAfter - uBefore);
}

TEST(SystemTime, SleepsAtLeastAsLongAsAsked)
{
    for (unsigned uPause : {0U, 20U, 1001U})
    {
        const auto start = std::chrono::steady_clock::now();
        Sleep(uPause);
        EXPECT_GE(std::chrono::steady_clock::now() - start, std::chrono::milliseconds(uPause));
    }
}
