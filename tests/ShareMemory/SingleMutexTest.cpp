#include "MemManager/SingleMutex.h"

#include "Common/DataPaths.h"
#include "MemManager/MappingGuards.h"
#include "tests/Support/ChildProcess.h"
#include "tests/Support/DataDirectory.h"
#include "tests/Support/LogCapture.h"

#include <fcntl.h>
#include <filesystem>
#include <gtest/gtest.h>
#include <iterator>
#include <sys/stat.h>
#include <unistd.h>

namespace
{

constexpr int DEBUG_LINE = 3;
using Lines = std::vector<std::string>;

std::ptrdiff_t OpenDescriptors()
{
    namespace fs = std::filesystem;
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
    EXPECT_GT(iFd, 0);
    EXPECT_EQ(CDataDirectory::ReadBytes(CDataPaths::LockFile()), "");
    struct stat info = {};
    ASSERT_EQ(stat(CDataPaths::LockFile(), &info), 0);
    EXPECT_EQ(info.st_mode & 0777, 0777U);
    EXPECT_EQ(umask(0), 0U);
    EXPECT_NE(fcntl(iFd, F_GETFD) & FD_CLOEXEC, 0) << "started programs would keep the lock";
    EXPECT_EQ(CSingleMutex::UnLock(&iFd), 1);
    const Lines vExpected = {"QV_Contacts:Lock TRY LOCK", "QV_Contacts:LOCK RET = 1 ",
                             "QV_Contacts:UnLock TRY UNLOCK", "QV_Contacts:UNLOCK RET = 1 "};
    EXPECT_EQ(m_log.Texts(DEBUG_LINE), vExpected);
    EXPECT_EQ(m_log.Lines().size(), vExpected.size());
}

TEST_F(SingleMutex, RefusesASecondHolderAtOnce)
{
    CStoreLock held;
    ASSERT_TRUE(held.TryLock());
    const std::ptrdiff_t iOpen = OpenDescriptors();
    m_log.Clear();
    int iFd = 77;
    EXPECT_EQ(CSingleMutex::Lock(&iFd), 0);
    EXPECT_EQ(iFd, 0);
    EXPECT_EQ(OpenDescriptors(), iOpen);
    EXPECT_EQ(m_log.Texts(DEBUG_LINE),
              (Lines{"QV_Contacts:Lock TRY LOCK", "QV_Contacts:LOCK RET = 0 "}));
    held.Release();
    EXPECT_EQ(CSingleMutex::Lock(&iFd), 1);
    EXPECT_EQ(CSingleMutex::UnLock(&iFd), 1);
}

TEST_F(SingleMutex, IsFreeAgainWhenItsProcessDies)
{
    CLockHolder holder;
    CStoreLock lock;
    EXPECT_FALSE(lock.TryLock());
    holder.Kill();
    EXPECT_TRUE(lock.TryLock());
}

TEST_F(SingleMutex, NothingHeldNeedsNoFile)
{
    int iFd = 0;
    EXPECT_EQ(CSingleMutex::UnLock(&iFd), 1);
    EXPECT_FALSE(CDataDirectory::Exists(CDataPaths::LockFile()));
    EXPECT_EQ(m_log.Texts(DEBUG_LINE),
              (Lines{"QV_Contacts:UnLock TRY UNLOCK", "QV_Contacts:UNLOCK RET = 1 "}));
    m_log.Clear();
    EXPECT_EQ(CSingleMutex::Lock(nullptr), 0);
    EXPECT_EQ(CSingleMutex::UnLock(nullptr), 0);
    EXPECT_EQ(m_log.Texts(DEBUG_LINE),
              (Lines{"QV_Contacts:Lock TRY LOCK", "QV_Contacts:UnLock TRY UNLOCK"}));
}

TEST_F(SingleMutex, FailsOnWhatIsNoLockFile)
{
    std::filesystem::create_directory(CDataPaths::LockFile());
    int iFd = 77;
    EXPECT_EQ(CSingleMutex::Lock(&iFd), 0);
    EXPECT_EQ(iFd, 0);
    EXPECT_TRUE(m_log.Has(DEBUG_LINE, "QV_Contacts:LOCK RET = 0 "));

    iFd = open("/dev/null", O_RDONLY);
    close(iFd);
    m_log.Clear();
    EXPECT_EQ(CSingleMutex::UnLock(&iFd), 0);
    EXPECT_TRUE(m_log.Has(DEBUG_LINE, "QV_Contacts:UNLOCK RET = 0 "));
}

TEST_F(SingleMutex, TellsAHeldLockFromNoneWithoutStandardStreams)
{
    EXPECT_TRUE(RunInChild(
        []
        {
            for (const int iFd : {STDIN_FILENO, STDOUT_FILENO, STDERR_FILENO})
            {
                close(iFd);
            }
            int iFd = 0;
            EXPECT_EQ(CSingleMutex::Lock(&iFd), 1);
            EXPECT_GT(iFd, STDERR_FILENO);
            EXPECT_EQ(fcntl(STDIN_FILENO, F_GETFD), -1) << "the descriptor was moved, not doubled";
            EXPECT_NE(fcntl(iFd, F_GETFD) & FD_CLOEXEC, 0);
            CStoreLock second;
            EXPECT_FALSE(second.TryLock());
            EXPECT_EQ(CSingleMutex::UnLock(&iFd), 1);
            EXPECT_TRUE(second.TryLock());
        }));
}

} // namespace
