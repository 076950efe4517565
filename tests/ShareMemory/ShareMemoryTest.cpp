// Mapped files and the lock, on real files and beside other processes.

#include "MemManager/Files/ShareMemory.h"

#include "Common/DataPaths.h"
#include "MemManager/Files/SingleMutex.h"
#include "MemManager/Files/StoreLock.h"
#include "tests/Support/ChildProcess.h"
#include "tests/Support/DataDirectory.h"
#include "tests/Support/LogCapture.h"

#include <cerrno>
#include <dlfcn.h>
#include <fcntl.h>
#include <filesystem>
#include <gtest/gtest.h>
#include <regex>
#include <sched.h>
#include <sys/mman.h>
#include <sys/mount.h>
#include <sys/resource.h>
#include <sys/stat.h>
#include <unistd.h>

static bool g_bReserves = true; // space on the disk

// Takes the C library's place in the test program; some file systems reserve nothing.
extern "C" int fallocate(int iFd, int iMode, off_t iAt, off_t iSize)
{
    const auto pfnNext = reinterpret_cast<decltype(&fallocate)>(dlsym(RTLD_NEXT, "fallocate"));
    errno = EOPNOTSUPP;
    return g_bReserves ? pfnNext(iFd, iMode, iAt, iSize) : -1;
}

namespace
{

class ShareMemory : public testing::Test
{
protected:
    void* Open(size_t uSize) const { return OpenWriteShareMemory(m_strPath.c_str(), uSize); }

    CDataDirectory m_directory;
    CLogCapture m_log;
    std::string m_strPath = m_directory.File("shared.bin");
};

using SingleMutex = ShareMemory;

TEST_F(ShareMemory, GivesFilesTheirSizeAndALastZero)
{
    const std::pair<std::string, std::string> ROWS[] = {
        {"", std::string(12, '\0')},
        {"short", std::string("short\0\0\0\0\0\0\0", 12)},
        {std::string(100, 'x'), std::string(11, 'x') + '\0' + std::string(88, 'x')},
    };
    for (const auto& [strBefore, strAfter] : ROWS)
    {
        CDataDirectory::WriteBytes(m_strPath, strBefore);
        void* pAddr = Open(12);
        ASSERT_NE(pAddr, MAP_FAILED);
        EXPECT_EQ(CDataDirectory::ReadBytes(m_strPath), strAfter);
        CloseWriteShareMemory(pAddr, 12, 0);
    }
    std::filesystem::remove(m_strPath);
    const mode_t iOldMask = umask(077);
    void* pAddr = OpenShareMemory(m_strPath.c_str(), 12);
    EXPECT_EQ(umask(iOldMask), 0U);
    ASSERT_NE(pAddr, MAP_FAILED);
    CloseShareMemory(pAddr, 12);
    EXPECT_EQ(std::filesystem::status(m_strPath).permissions(), std::filesystem::perms::all);
    EXPECT_TRUE(m_log.Lines().empty());
}

// The error lines of each failure are in log.txt, without the numbers of the descriptors.
TEST_F(ShareMemory, TellsWhyNothingIsMappedOrClosed)
{
    EXPECT_EQ(Open(0), MAP_FAILED);
    EXPECT_EQ(OpenShareMemory(m_strPath.c_str(), SIZE_MAX), MAP_FAILED);
    CDataDirectory::WriteBytes(m_strPath, std::string(11, 'x'));
    EXPECT_EQ(OpenReadShareMemory(m_strPath.c_str(), 12), MAP_FAILED);
    char* pInPage = reinterpret_cast<char*>(4097); // belongs to no mapping
    CloseShareMemory(pInPage, 12);
    CloseWriteShareMemory(pInPage, 12, 0);
    EXPECT_NE(CloseReadShareMemory(pInPage, 12), 0);
    EXPECT_EQ(CloseReadShareMemory(nullptr, 12), 0);
    const std::string strPipe = m_directory.File("pipe");
    ASSERT_EQ(mkfifo(strPipe.c_str(), 0700), 0); // is refused without waiting
    for (const std::string& strPath : {m_directory.File("no/such/directory"), strPipe})
    {
        EXPECT_EQ(OpenShareMemory(strPath.c_str(), 12), MAP_FAILED);
        EXPECT_EQ(OpenWriteShareMemory(strPath.c_str(), 12), MAP_FAILED);
        EXPECT_EQ(OpenReadShareMemory(strPath.c_str(), 12), MAP_FAILED);
    }
    char cRead = 0;
    int iLen = 1;
    EXPECT_EQ(readFromFile(m_directory.File("missing").c_str(), &cRead, &iLen), 0);
    EXPECT_EQ(iLen, 1);
    EXPECT_EQ(writeToFile("/dev/full", "abc", 3), 0);
    const std::string strTold =
        std::regex_replace(m_log.Take(), std::regex("hFile=[0-9]+"), "hFile=#");
    EXPECT_EQ(std::regex_replace(strTold, std::regex(m_directory.Root()), "ROOT"),
              CDataDirectory::ReadBytes(QV_TEST_DATA "/ShareMemory/log.txt"));
}

// The signal that comes with passing the limit would end the child.
TEST_F(ShareMemory, RefusesASizeAboveTheProcessLimit)
{
    CDataDirectory::WriteBytes(m_strPath, std::string(6000, 'x'));
    CChild child(
        [&]
        {
            rlimit limit = {4096, RLIM_INFINITY};
            ASSERT_EQ(setrlimit(RLIMIT_FSIZE, &limit), 0);
            EXPECT_EQ(Open(5000), MAP_FAILED);
            EXPECT_NE(Open(4096), MAP_FAILED);
            limit.rlim_cur = RLIM_INFINITY;
            setrlimit(RLIMIT_FSIZE, &limit);
        });
    EXPECT_TRUE(child.Passes());
}

// Where the system reserves space and where it does not.
TEST_F(ShareMemory, HoldsEveryByteOnTheDiskOrLeavesTheFileAlone)
{
    constexpr off_t SIZE = 300000;
    for (const bool bReserves : {false, true})
    {
        g_bReserves = bReserves;
        std::string strSparse(SIZE, '\0');
        strSparse[100] = strSparse[65536] = strSparse[130000] = 'x';
        CDataDirectory::WriteBytes(m_strPath, strSparse.substr(0, 130001));
        ASSERT_EQ(truncate(m_strPath.c_str(), SIZE - 100000), 0); // with a hole
        void* pAddr = Open(SIZE);
        ASSERT_NE(pAddr, MAP_FAILED);
        CloseShareMemory(pAddr, SIZE);
        EXPECT_EQ(CDataDirectory::ReadBytes(m_strPath), strSparse);
        struct stat info = {};
        EXPECT_EQ(stat(m_strPath.c_str(), &info), 0);
        EXPECT_GE(info.st_blocks * 512, SIZE);
        // On a file system of 64 KiB that only the child sees, if this user can mount one.
        CChild child(
            [&]
            {
                if (unshare(CLONE_NEWNS) != 0 ||
                    mount("none", "/", nullptr, MS_REC | MS_PRIVATE, "") != 0 ||
                    mount("none", m_directory.File("").c_str(), "tmpfs", 0, "size=64k") != 0)
                {
                    return;
                }
                const std::string strOld(5000, 'x');
                CDataDirectory::WriteBytes(m_strPath, strOld);
                EXPECT_EQ(Open(200000), MAP_FAILED);
                EXPECT_NE(m_log.Texts(ERROR_LINE).back().find(": No space left"),
                          std::string::npos);
                EXPECT_EQ(CDataDirectory::ReadBytes(m_strPath), strOld);
                // A file with holes is long enough and still has no place on the disk.
                ASSERT_EQ(truncate(m_strPath.c_str(), SIZE), 0);
                EXPECT_EQ(Open(200000), MAP_FAILED);
                ASSERT_EQ(truncate(m_strPath.c_str(), 5000), 0);
                EXPECT_NE(Open(40000), MAP_FAILED) << "what the failed attempts took is free";
            });
        EXPECT_TRUE(child.Passes());
    }
}

TEST_F(ShareMemory, WritesAndReadsWholeFiles)
{
    char szBuffer[8] = "untouch";
    int iLen = 8;
    EXPECT_EQ(writeToFile(m_strPath.c_str(), "longer", 6), 1);
    EXPECT_EQ(writeToFile(m_strPath.c_str(), "abc", 3), 1);
    EXPECT_EQ(readFromFile(m_strPath.c_str(), szBuffer, &iLen), 1);
    EXPECT_EQ(iLen, 3);
    EXPECT_STREQ(szBuffer, "abcouch");
}

TEST_F(SingleMutex, TakesAndReleases)
{
    umask(077);
    int iFd = 0;
    EXPECT_EQ(CSingleMutex::UnLock(&iFd), 1) << "nothing is held";
    EXPECT_EQ(CSingleMutex::Lock(&iFd), 1);
    EXPECT_EQ(umask(0), 0U);
    EXPECT_EQ(CDataDirectory::ReadBytes(CDataPaths::LockFile()), "");
    EXPECT_EQ(std::filesystem::status(CDataPaths::LockFile()).permissions(),
              std::filesystem::perms::all);
    EXPECT_NE(fcntl(iFd, F_GETFD) & FD_CLOEXEC, 0) << "started programs would keep the lock";
    std::filesystem::remove(CDataPaths::LockFile());
    EXPECT_TRUE(CSingleMutex::IsHeld(iFd)) << "also without its name";
    EXPECT_EQ(CSingleMutex::UnLock(&iFd), 1);
    EXPECT_EQ(fcntl(iFd, F_GETFD), -1);
}

// A holder knows descriptor 0 as none.
TEST_F(SingleMutex, TakesNoDescriptorOfTheStandardStreams)
{
    CChild child(
        []
        {
            close(STDIN_FILENO);
            int iFd = 0;
            EXPECT_EQ(CSingleMutex::Lock(&iFd), 1);
            EXPECT_GT(iFd, STDERR_FILENO);
            EXPECT_NE(fcntl(iFd, F_GETFD) & FD_CLOEXEC, 0);
            EXPECT_EQ(fcntl(STDIN_FILENO, F_GETFD), -1) << "the first number is free again";
        });
    EXPECT_TRUE(child.Passes());
}

TEST_F(SingleMutex, LeavesAloneWhatWasClosedBehindItsBack)
{
    int iFd = 0;
    ASSERT_EQ(CSingleMutex::Lock(&iFd), 1);
    EXPECT_TRUE(CSingleMutex::IsHeld(iFd));
    close(iFd);
    EXPECT_FALSE(CSingleMutex::IsHeld(iFd));
    const int iOther = open("/dev/null", O_RDONLY);
    ASSERT_EQ(iOther, iFd) << "the number has a new owner";
    EXPECT_FALSE(CSingleMutex::IsHeld(iFd));
    EXPECT_EQ(CSingleMutex::UnLock(&iFd), 0);
    EXPECT_EQ(m_log.Lines().back().strText, "QV_Contacts:UNLOCK RET = 0 ");
    EXPECT_EQ(close(iOther), 0) << "it was not ours to close";
}

// Who comes second is refused as long as there is the first, and tries again meanwhile.
TEST_F(SingleMutex, TellsAHeldLockFromNone)
{
    CLockHolder holder;
    int iFd = 77;
    EXPECT_EQ(CSingleMutex::Lock(&iFd), 0);
    EXPECT_EQ(iFd, 0);
    CStoreLock lock;
    EXPECT_EQ(lock.TryLock(), LOCK_REFUSED);
    m_log.AtLinesWith("QV_Contacts:LOCK RET = 0 ", [&] { holder.Release(); });
    EXPECT_TRUE(TryStoreLock(&lock, [](int iAttempt) { ADD_FAILURE() << iAttempt; }));
    lock.Release();
    std::filesystem::remove(CDataPaths::LockFile());
    ASSERT_EQ(mkfifo(CDataPaths::LockFile(), 0700), 0);
    m_log.Clear();
    EXPECT_EQ(lock.TryLockQuietly(), LOCK_UNAVAILABLE) << "a pipe";
    std::filesystem::remove(CDataPaths::LockFile());
    std::filesystem::create_directory(CDataPaths::LockFile());
    EXPECT_EQ(lock.TryLockQuietly(), LOCK_UNAVAILABLE) << "a directory";
    std::filesystem::remove(CDataPaths::LockFile());
    EXPECT_EQ(lock.TryLockQuietly(), LOCK_TAKEN);
    EXPECT_EQ(m_log.Lines().size(), 0U);
}

} // namespace
