#include "Common/SystemTime.h"

#include <gtest/gtest.h>
#include <sys/time.h>

#include <chrono>
#include <csignal>
#include <cstdlib>
#include <cstring>
#include <ctime>

TEST(SystemTime, PointsInTimeHaveTheirCalendarForm)
{
    ASSERT_EQ(0, setenv("TZ", "CET-1CEST,M3.5.0,M10.5.0/3", 1));
    tzset();
    struct
    {
        tag_FileTime point;
        tag_SystemTime calendar;
        int iDaylightSeconds; // that the calendar form is ahead of standard time
    } const cases[] = {
        {{999, 1072911599}, {2003, 12, 3, 31, 23, 59, 59, 999}, 0},
        {{500, 1078009200}, {2004, 2, 0, 29, 0, 0, 0, 500}, 0},
        {{0, 1091354400}, {2004, 8, 0, 1, 12, 0, 0, 0}, 3600},
        {{0, -1}, {1970, 1, 4, 1, 0, 59, 59, 0}, 0},
        {{0, INT32_MAX}, {2038, 1, 2, 19, 4, 14, 7, 0}, 0},
    };
    for (const auto& item : cases)
    {
        tag_SystemTime calendar = {};
        EXPECT_EQ(1, FileTimeToSystemTime(&item.point, &calendar));
        EXPECT_EQ(0, std::memcmp(&item.calendar, &calendar, sizeof(calendar)))
            << item.point.seconds;
        tag_FileTime point = {7, 7};
        EXPECT_EQ(1, SystemTimeToFileTime(&calendar, &point));
        EXPECT_EQ(item.point.milliseconds, point.milliseconds);
        EXPECT_EQ(item.point.seconds + item.iDaylightSeconds, point.seconds);
    }
    const tag_SystemTime beyond = {2200, 1, 0, 1, 0, 0, 0, 5};
    tag_FileTime point = {};
    EXPECT_EQ(1, SystemTimeToFileTime(&beyond, &point));
    EXPECT_EQ(-1, point.seconds);
    unsetenv("TZ");
    tzset();
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

TEST(SystemTime, SignalsDoNotShortenAPause)
{
    constexpr auto PAUSE = std::chrono::milliseconds(60);
    struct sigaction action = {};
    struct sigaction previous = {};
    action.sa_handler = [](int /*iSignal*/) {};
    ASSERT_EQ(0, sigaction(SIGALRM, &action, &previous));
    const itimerval often = {{0, 500}, {0, 500}};
    const itimerval never = {};
    ASSERT_EQ(0, setitimer(ITIMER_REAL, &often, nullptr));
    const auto start = std::chrono::steady_clock::now();
    Sleep(static_cast<unsigned>(PAUSE.count()));
    const auto pause = std::chrono::steady_clock::now() - start;
    setitimer(ITIMER_REAL, &never, nullptr);
    sigaction(SIGALRM, &previous, nullptr);
    EXPECT_GE(pause, PAUSE);
}
