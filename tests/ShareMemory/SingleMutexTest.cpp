#include "MemManager/SingleMutex.h"

#include "Common/DataPaths.h"
#include "MemManager/MappingGuards.h"
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
    holder.Kill();
    EXPECT_TRUE(CStoreLock().TryLock());
}

TEST_F(SingleMutex, TellsWhatCannotBeReleased)
{
    int iFd = 0;
    EXPECT_EQ(CSingleMutex::UnLock(&iFd), 1) << "nothing is held";
    iFd = open("/dev/null", O_RDONLY);
    close(iFd);
    m_log.Clear();
    EXPECT_EQ(CSingleMutex::UnLock(&iFd), 0);
    EXPECT_EQ(m_log.Texts(DEBUG_LINE),
              (Lines{"QV_Contacts:UnLock TRY UNLOCK", "QV_Contacts:UNLOCK RET = 0 "}));
}

} // namespace
