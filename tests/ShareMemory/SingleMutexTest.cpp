#include "MemManager/Files/SingleMutex.h"

#include "Common/DataPaths.h"
#include "MemManager/LockAttempts.h"
#include "tests/Support/ChildProcess.h"
#include "tests/Support/DataDirectory.h"
#include "tests/Support/LogCapture.h"

#include <fcntl.h>
#include <filesystem>
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

namespace
{

namespace fs = std::filesystem;

std::ptrdiff_t OpenDescriptors()
{
    return std::distance(fs::directory_iterator("/proc/self/fd"), fs::directory_iterator());
}

class SingleMutex : public testing::Test
{
protected:
    CDataDirectory m_directory;
    CLogCapture m_log;
};

TEST_F(SingleMutex, TakesAndReleases)
{
    umask(077);
    int iFd = 0;
    EXPECT_EQ(CSingleMutex::Lock(&iFd), 1);
    EXPECT_EQ(CDataDirectory::ReadBytes(CDataPaths::LockFile()), "");
    EXPECT_EQ(fs::status(CDataPaths::LockFile()).permissions(), fs::perms::all);
    EXPECT_EQ(umask(0), 0U);
    EXPECT_NE(fcntl(iFd, F_GETFD) & FD_CLOEXEC, 0) << "started programs would keep the lock";
    EXPECT_EQ(CSingleMutex::UnLock(&iFd), 1);
    EXPECT_EQ(m_log.Texts(DEBUG_LINE),
              (Lines{"QV_Contacts:Lock TRY LOCK", "QV_Contacts:LOCK RET = 1 ",
                     "QV_Contacts:UnLock TRY UNLOCK", "QV_Contacts:UNLOCK RET = 1 "}));
}

// The first refusal is what ends the other holder of the second attempt.
TEST_F(SingleMutex, RefusesASecondHolderUntilTheFirstDies)
{
    CLockHolder holder;
    const std::ptrdiff_t iOpen = OpenDescriptors();
    int iFd = 77;
    EXPECT_EQ(CSingleMutex::Lock(&iFd), 0);
    EXPECT_EQ(iFd, 0);
    EXPECT_EQ(OpenDescriptors(), iOpen);
    EXPECT_EQ(m_log.Texts(DEBUG_LINE),
              (Lines{"QV_Contacts:Lock TRY LOCK", "QV_Contacts:LOCK RET = 0 "}));
    m_log.AtEachLine(
        [&](const std::string& strText)
        {
            if (strText == "QV_Contacts:LOCK RET = 0 ")
            {
                holder.Kill();
            }
        });
    CStoreLock lock;
    int iRefused = 0;
    EXPECT_TRUE(TryStoreLock(&lock, [&](int /*iAttempt*/) { ++iRefused; }));
    EXPECT_EQ(iRefused, 0);
}

// A holder knows descriptor 0 as none.
TEST_F(SingleMutex, TakesNoDescriptorOfTheStandardStreams)
{
    EXPECT_TRUE(RunInChild(
        []
        {
            close(STDIN_FILENO);
            int iFd = 0;
            EXPECT_EQ(CSingleMutex::Lock(&iFd), 1);
            EXPECT_GT(iFd, STDERR_FILENO);
            EXPECT_NE(fcntl(iFd, F_GETFD) & FD_CLOEXEC, 0);
            EXPECT_EQ(fcntl(STDIN_FILENO, F_GETFD), -1) << "the first number is free again";
            EXPECT_EQ(CSingleMutex::UnLock(&iFd), 1);
            EXPECT_EQ(fcntl(iFd, F_GETFD), -1);
        }));
}

TEST_F(SingleMutex, LeavesAloneWhatWasClosedBehindItsBack)
{
    int iFd = 0;
    EXPECT_EQ(CSingleMutex::UnLock(&iFd), 1) << "nothing is held";
    ASSERT_EQ(CSingleMutex::Lock(&iFd), 1);
    EXPECT_TRUE(CSingleMutex::IsHeld(iFd));
    close(iFd);
    EXPECT_FALSE(CSingleMutex::IsHeld(iFd));
    const int iOther = open("/dev/null", O_RDONLY);
    ASSERT_EQ(iOther, iFd) << "the number has a new owner";
    EXPECT_FALSE(CSingleMutex::IsHeld(iFd));
    m_log.Clear();
    EXPECT_EQ(CSingleMutex::UnLock(&iFd), 0);
    EXPECT_EQ(m_log.Texts(DEBUG_LINE),
              (Lines{"QV_Contacts:UnLock TRY UNLOCK", "QV_Contacts:UNLOCK RET = 0 "}));
    EXPECT_EQ(fcntl(iOther, F_GETFD), 0) << "it is not ours to close";
    EXPECT_EQ(CSingleMutex::Lock(&iFd), 1);
    fs::remove(CDataPaths::LockFile());
    EXPECT_TRUE(CSingleMutex::IsHeld(iFd)) << "also without its name";
    EXPECT_EQ(CSingleMutex::UnLock(&iFd), 1);
    EXPECT_EQ(fcntl(iFd, F_GETFD), -1);
    close(iOther);
}

TEST_F(SingleMutex, TellsAHeldLockFromNone)
{
    CStoreLock lock;
    {
        const CLockHolder holder;
        EXPECT_EQ(lock.TryLock(), LOCK_REFUSED);
    }
    fs::remove(CDataPaths::LockFile());
    ASSERT_EQ(mkfifo(CDataPaths::LockFile(), 0700), 0);
    EXPECT_EQ(lock.TryLock(), LOCK_UNAVAILABLE) << "a pipe";
    fs::remove(CDataPaths::LockFile());
    fs::create_directory(CDataPaths::LockFile());
    m_log.Clear();
    EXPECT_EQ(lock.TryLockQuietly(), LOCK_UNAVAILABLE) << "a directory";
    EXPECT_EQ(m_log.Texts(DEBUG_LINE), Lines{});
    fs::remove(CDataPaths::LockFile());
    EXPECT_EQ(lock.TryLockQuietly(), LOCK_TAKEN);
}

} // namespace
