// Files and times of the system.

#include "Common/FileHelpers.h"
#include "Common/SystemTime.h"
#include "tests/Support/DataDirectory.h"
#include "tools/Utf8Text.h"

#include <chrono>
#include <csignal>
#include <cstring>
#include <filesystem>
#include <gtest/gtest.h>
#include <iterator>
#include <string>
#include <sys/time.h>

namespace fs = std::filesystem;

namespace
{

// Works with relative names in a directory of its own.
class Files : public testing::Test
{
protected:
    Files() { fs::current_path(m_directory.File("")); }
    ~Files() override { fs::current_path("/"); }

    static void Make(const std::string& strName) { CDataDirectory::WriteBytes(strName, strName); }
    static long Entries()
    {
        return std::distance(fs::directory_iterator("."), fs::directory_iterator());
    }

private:
    CDataDirectory m_directory;
};

// Milliseconds of the wall clock.
uint32_t Now()
{
    const auto sinceEpoch = std::chrono::system_clock::now().time_since_epoch();
    return static_cast<uint32_t>(sinceEpoch / std::chrono::milliseconds(1));
}

} // namespace

TEST_F(Files, HaveNamesThatAShellWouldMakeSomethingElseOf)
{
    fs::create_directories("bystander/deep");
    for (const std::string strName : {" blank around ", "quote'in'it", "$(touch owned)",
                                      "a\ntouch owned", "back\\slash\\", "~", "-rf", "张三"})
    {
        SCOPED_TRACE(strName);
        Make(strName);
        EXPECT_EQ(1, _MoveFile(strName.c_str(), "moved"));
        EXPECT_EQ(strName, CDataDirectory::ReadBytes("moved"));
        EXPECT_EQ(1, _wc_MoveFile(L"moved", WideText(strName).c_str()));
        EXPECT_EQ(strName, CDataDirectory::ReadBytes(strName));
        EXPECT_EQ(1, _wc_DeleteFile(WideText(strName).c_str()));
        Make(strName);
        EXPECT_EQ(1, _DeleteFile(strName.c_str()));
        EXPECT_EQ(1, Entries());
    }
    EXPECT_EQ(1, _DeleteFile("bystander"));
    EXPECT_EQ(0, Entries()) << "whole directories";
    // What quoting adds takes nothing from the length of a path.
    Make("file");
    const std::string strQuotes(200, '\'');
    const std::string strLong = "." + std::string(3800, '/') + strQuotes;
    EXPECT_EQ(1, _MoveFile("file", strLong.c_str()));
    EXPECT_EQ("file", CDataDirectory::ReadBytes(strQuotes));
    EXPECT_EQ(1, _DeleteFile(strLong.c_str()));
    EXPECT_EQ(0, Entries());
    EXPECT_EQ(1, _MoveFile(nullptr, "file"));
    EXPECT_EQ(1, _DeleteFile(nullptr));
    EXPECT_EQ(1, _wc_MoveFile(nullptr, L"file"));
    EXPECT_EQ(1, _wc_DeleteFile(nullptr));
    EXPECT_EQ(-1, CDataPaths::SetRoot(strLong.c_str()));
    wchar_t szPath[5000] = {};
    EXPECT_EQ(0, GetModuleFileName(nullptr, szPath, 4096));
    EXPECT_EQ(WideText(fs::read_symlink("/proc/self/exe").string()), szPath);
}

TEST(SystemTime, PointsInTimeHaveTheirCalendarForm)
{
    ASSERT_EQ(0, setenv("TZ", "CET-1CEST,M3.5.0,M10.5.0/3", 1));
    const struct
    {
        tag_FileTime point;
        tag_SystemTime calendar;
        int iDaylightSeconds; // that the calendar form is ahead of standard time
    } ROWS[] = {
        {{999, 1072911599}, {2003, 12, 3, 31, 23, 59, 59, 999}, 0},
        {{500, 1078009200}, {2004, 2, 0, 29, 0, 0, 0, 500}, 0},
        {{0, 1091354400}, {2004, 8, 0, 1, 12, 0, 0, 0}, 3600},
        {{0, -1}, {1970, 1, 4, 1, 0, 59, 59, 0}, 0},
        {{0, INT32_MAX}, {2038, 1, 2, 19, 4, 14, 7, 0}, 0},
    };
    tag_FileTime point = {7, 7};
    for (const auto& row : ROWS)
    {
        tag_SystemTime calendar = {};
        EXPECT_EQ(1, FileTimeToSystemTime(&row.point, &calendar));
        EXPECT_EQ(0, std::memcmp(&row.calendar, &calendar, sizeof(calendar))) << row.point.seconds;
        EXPECT_EQ(1, SystemTimeToFileTime(&calendar, &point));
        EXPECT_EQ(row.point.milliseconds, point.milliseconds);
        EXPECT_EQ(row.point.seconds + row.iDaylightSeconds, point.seconds);
    }
    const tag_SystemTime beyond = {2200, 1, 0, 1, 0, 0, 0, 5};
    EXPECT_EQ(1, SystemTimeToFileTime(&beyond, &point));
    EXPECT_EQ(-1, point.seconds);
    unsetenv("TZ");
    tzset();
}

// Ticks are the low bits of the wall clock; signals do not shorten a pause.
TEST(SystemTime, TellsTicksAndPauses)
{
    const uint32_t uBefore = Now();
    const uint32_t uTicks = static_cast<uint32_t>(GetTickCount());
    EXPECT_LE(uTicks - uBefore, Now() - uBefore);
    (void)std::signal(SIGALRM, [](int /*iSignal*/) {});
    const itimerval often = {{0, 500}, {0, 500}};
    const itimerval never = {};
    ASSERT_EQ(0, setitimer(ITIMER_REAL, &often, nullptr));
    const auto start = std::chrono::steady_clock::now();
    Sleep(60);
    EXPECT_GE(std::chrono::steady_clock::now() - start, std::chrono::milliseconds(60));
    setitimer(ITIMER_REAL, &never, nullptr);
    (void)std::signal(SIGALRM, SIG_DFL);
}
