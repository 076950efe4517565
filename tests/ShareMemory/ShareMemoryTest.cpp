#include "MemManager/ShareMemory.h"

#include "tests/Support/ChildProcess.h"
#include "tests/Support/DataDirectory.h"
#include "tests/Support/LogCapture.h"

#include <cerrno>
#include <cstddef>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <gtest/gtest.h>
#include <iterator>
#include <linux/filter.h>
#include <linux/seccomp.h>
#include <regex>
#include <sched.h>
#include <sys/mman.h>
#include <sys/mount.h>
#include <sys/prctl.h>
#include <sys/resource.h>
#include <sys/stat.h>
#include <sys/syscall.h>
#include <unistd.h>

namespace
{

// The error text as it stands at the end of most lines.
std::string ErrorText(int iError, const char* szBetween = " : ")
{
    return std::to_string(iError) + szBetween + std::strerror(iError);
}

// Makes a system call fail for the rest of this process, or only those of its calls whose second
// argument is iSecond. False where that is not possible.
bool RefuseCall(unsigned uCall, int iError, unsigned uSecond = 0)
{
    const auto uErrno = static_cast<unsigned>(iError);
    const auto uAny = static_cast<unsigned char>(uSecond == 0 ? 1 : 0);
    sock_filter program[] = {
        BPF_STMT(BPF_LD | BPF_W | BPF_ABS, offsetof(seccomp_data, nr)),
        BPF_JUMP(BPF_JMP | BPF_JEQ | BPF_K, uCall, 0, 3),
        BPF_STMT(BPF_LD | BPF_W | BPF_ABS, offsetof(seccomp_data, args[1])),
        BPF_JUMP(BPF_JMP | BPF_JEQ | BPF_K, uSecond, 0, 1),
        BPF_STMT(BPF_RET | BPF_K, SECCOMP_RET_ERRNO | uErrno),
        BPF_STMT(BPF_RET | BPF_K, SECCOMP_RET_ALLOW),
    };
    program[3].jf = static_cast<unsigned char>(1 - uAny);
    sock_fprog filter = {std::size(program), program};
    return prctl(PR_SET_NO_NEW_PRIVS, 1, 0, 0, 0) == 0 &&
           prctl(PR_SET_SECCOMP, SECCOMP_MODE_FILTER, &filter) == 0;
}

bool RefuseReservations()
{
    return RefuseCall(SYS_fallocate, EOPNOTSUPP);
}

#ifdef SYS_mmap2
constexpr unsigned MMAP_CALL = SYS_mmap2;
#else
constexpr unsigned MMAP_CALL = SYS_mmap;
#endif

off_t BytesOnDisk(const std::string& strPath)
{
    struct stat info = {};
    stat(strPath.c_str(), &info);
    return info.st_blocks * 512;
}

class ShareMemory : public testing::Test
{
protected:
    void* Open(size_t uSize) const { return OpenWriteShareMemory(m_strPath.c_str(), uSize); }

    // The error lines since the last call, without the numbers of the descriptors.
    Lines Errors()
    {
        Lines vTexts = m_log.Texts(ERROR_LINE);
        for (std::string& strText : vTexts)
        {
            strText = std::regex_replace(strText, std::regex("hFile=[0-9]+"), "hFile=#");
        }
        m_log.Clear();
        return vTexts;
    }
    Lines MapError(const char* szOperation, int iError) const
    {
        return {std::string("QV_Contacts: ") + szOperation + ":" + m_strPath +
                ", hFile=#, error:" + ErrorText(iError)};
    }

    CDataDirectory m_directory;
    CLogCapture m_log;
    std::string m_strPath = m_directory.File("shared.bin");
};

TEST_F(ShareMemory, GivesFilesTheirSizeAndALastZero)
{
    const std::pair<std::string, std::string> cases[] = {
        {"", std::string(12, '\0')},
        {"short", std::string("short") + std::string(7, '\0')},
        {std::string(100, 'x'), std::string(11, 'x') + '\0' + std::string(88, 'x')},
    };
    for (const auto& [strBefore, strAfter] : cases)
    {
        CDataDirectory::WriteBytes(m_strPath, strBefore);
        void* pAddr = Open(12);
        ASSERT_NE(pAddr, MAP_FAILED);
        EXPECT_EQ(CDataDirectory::ReadBytes(m_strPath), strAfter);
        CloseWriteShareMemory(pAddr, 12, 0);
    }
    EXPECT_TRUE(m_log.Lines().empty());
}

TEST_F(ShareMemory, CreatesForEverybodyAndLeavesTheMaskAtZero)
{
    const mode_t iOldMask = umask(077);
    void* pAddr = OpenShareMemory(m_strPath.c_str(), 12);
    EXPECT_EQ(umask(iOldMask), 0U);
    ASSERT_NE(pAddr, MAP_FAILED);
    CloseShareMemory(pAddr, 12);
    EXPECT_EQ(std::filesystem::status(m_strPath).permissions(), std::filesystem::perms::all);
}

TEST_F(ShareMemory, TellsWhyNothingIsMapped)
{
    EXPECT_EQ(Open(0), MAP_FAILED);
    EXPECT_EQ(Errors(), MapError("OpenWriteShareMemory", EINVAL));
    EXPECT_EQ(OpenShareMemory(m_strPath.c_str(), SIZE_MAX), MAP_FAILED);
    EXPECT_EQ(Errors(), MapError("OpenShareMemory", EFBIG));
    CDataDirectory::WriteBytes(m_strPath, std::string(11, 'x'));
    EXPECT_EQ(OpenReadShareMemory(m_strPath.c_str(), 12), MAP_FAILED);
    EXPECT_EQ(Errors(), MapError("OpenReadShareMemory", ENXIO));

    m_strPath = m_directory.File("no/such/directory");
    EXPECT_EQ(OpenShareMemory(m_strPath.c_str(), 12), MAP_FAILED);
    EXPECT_EQ(Open(12), MAP_FAILED);
    EXPECT_EQ(OpenReadShareMemory(m_strPath.c_str(), 12), MAP_FAILED);
    EXPECT_EQ(Errors(),
              (Lines{"QV_Contacts: OpenShareMemory error no2 = 2\n",
                     "QV_Contacts: OpenWriteShareMemory " + m_strPath + " error no2 = 2\n",
                     "QV_Contacts: OpenReadShareMemory:" + m_strPath + " error no2 = 2\n"}));
}

// The signal that comes with passing the limit would end the child.
TEST_F(ShareMemory, RefusesASizeAboveTheProcessLimit)
{
    const std::string strOld(6000, 'x');
    CDataDirectory::WriteBytes(m_strPath, strOld);
    EXPECT_TRUE(RunInChild(
        [&]
        {
            const rlimit limit = {4096, 4096};
            ASSERT_EQ(setrlimit(RLIMIT_FSIZE, &limit), 0);
            EXPECT_EQ(Open(5000), MAP_FAILED);
            EXPECT_EQ(Errors(), MapError("OpenWriteShareMemory", EFBIG));
            EXPECT_EQ(CDataDirectory::ReadBytes(m_strPath), strOld);
            EXPECT_NE(Open(4096), MAP_FAILED);
        }));
}

// Where the system reserves space and where it does not.
class FullDisk : public ShareMemory, public testing::WithParamInterface<bool>
{
protected:
    void SetUp() override
    {
        if (!GetParam() && !RunInChild([] { ASSERT_TRUE(RefuseReservations()); }))
        {
            GTEST_SKIP() << "no calls can be refused here";
        }
    }
};
INSTANTIATE_TEST_SUITE_P(Reserving, FullDisk, testing::Bool());

TEST_P(FullDisk, LeavesTheFileAlone)
{
    EXPECT_TRUE(RunInChild(
        [&]
        {
            // A file system of 64 KiB that only the child sees.
            if (unshare(CLONE_NEWNS) != 0 ||
                mount("none", "/", nullptr, MS_REC | MS_PRIVATE, "") != 0 ||
                mount("none", m_directory.File("").c_str(), "tmpfs", 0, "size=64k") != 0)
            {
                GTEST_SKIP() << "this user cannot mount";
            }
            ASSERT_TRUE(GetParam() || RefuseReservations());
            const std::string strOld(5000, 'x');
            CDataDirectory::WriteBytes(m_strPath, strOld);
            EXPECT_EQ(Open(200000), MAP_FAILED);
            EXPECT_EQ(Errors(), MapError("OpenWriteShareMemory", ENOSPC));
            EXPECT_EQ(CDataDirectory::ReadBytes(m_strPath), strOld);
            // A file with holes is as long as it has to be and still has no place on the disk.
            ASSERT_EQ(truncate(m_strPath.c_str(), 300000), 0);
            EXPECT_EQ(Open(200000), MAP_FAILED);
            ASSERT_EQ(truncate(m_strPath.c_str(), 5000), 0);
            // What the failed attempts took is free again.
            EXPECT_NE(Open(40000), MAP_FAILED);
        }));
}

TEST_P(FullDisk, HoldsWhatWasMappedInPlaceOfAHole)
{
    constexpr off_t SIZE = 300000;
    std::string strSparse(SIZE, '\0');
    CDataDirectory::WriteBytes(m_strPath, "");
    ASSERT_EQ(truncate(m_strPath.c_str(), SIZE - 100000), 0);
    std::fstream file(m_strPath, std::ios::in | std::ios::out | std::ios::binary);
    for (const size_t uAt : {size_t{100}, size_t{65536}, size_t{130000}})
    {
        strSparse[uAt] = 'x';
        file.seekp(static_cast<std::streamoff>(uAt)).put('x');
    }
    file.close();
    EXPECT_TRUE(RunInChild(
        [&]
        {
            ASSERT_TRUE(GetParam() || RefuseReservations());
            EXPECT_NE(Open(SIZE), MAP_FAILED);
        }));
    EXPECT_EQ(CDataDirectory::ReadBytes(m_strPath), strSparse);
    EXPECT_GE(BytesOnDisk(m_strPath), SIZE);
}

// Another process may have mapped the file as soon as it was long enough.
TEST_F(ShareMemory, LeavesAFileThatHasItsLength)
{
    constexpr unsigned SIZE = 123456;
    EXPECT_TRUE(RunInChild(
        [&]
        {
            if (!RefuseCall(MMAP_CALL, ENOMEM, SIZE))
            {
                GTEST_SKIP() << "no calls can be refused here";
            }
            EXPECT_EQ(Open(SIZE), MAP_FAILED);
            EXPECT_EQ(Errors(), MapError("OpenWriteShareMemory", ENOMEM));
            EXPECT_EQ(std::filesystem::file_size(m_strPath), SIZE);
        }));
}

TEST_F(ShareMemory, RefusesWhatIsNoFile)
{
    ASSERT_EQ(mkfifo(m_strPath.c_str(), 0700), 0);
    EXPECT_EQ(Open(12), MAP_FAILED);
    EXPECT_EQ(OpenReadShareMemory(m_strPath.c_str(), 12), MAP_FAILED) << "and does not wait";
    EXPECT_EQ(Errors(),
              (Lines{"QV_Contacts: OpenWriteShareMemory " + m_strPath + " error no2 = 22\n",
                     "QV_Contacts: OpenReadShareMemory:" + m_strPath + " error no2 = 22\n"}));
}

TEST_F(ShareMemory, ClosingTellsWhatFailed)
{
    char* pInPage = reinterpret_cast<char*>(4097); // belongs to no mapping
    CloseShareMemory(pInPage, 12);
    CloseWriteShareMemory(pInPage, 12, 0);
    EXPECT_NE(CloseReadShareMemory(pInPage, 12), 0);
    const std::string strError = ErrorText(EINVAL, "=");
    EXPECT_EQ(Errors(), (Lines{"QV_Contacts: CloseShareMemory msync error:" + strError,
                               "QV_Contacts: CloseShareMemory munmap error:" + strError,
                               "QV_Contacts: CloseWriteShareMemory msync error:" + strError,
                               "QV_Contacts: CloseWriteShareMemory munmap error:" + strError,
                               "QV_Contacts: CloseReadShareMemory munmap error:" + strError}));
}

TEST_F(ShareMemory, WritesAndReadsWholeFiles)
{
    char szBuffer[8] = "untouch";
    int iLen = 8;
    EXPECT_EQ(readFromFile(m_strPath.c_str(), szBuffer, &iLen), 0);
    EXPECT_EQ(iLen, 8);
    EXPECT_EQ(writeToFile(m_strPath.c_str(), "longer", 6), 1);
    EXPECT_EQ(writeToFile(m_strPath.c_str(), "abc", 3), 1);
    EXPECT_EQ(readFromFile(m_strPath.c_str(), szBuffer, &iLen), 1);
    EXPECT_EQ(iLen, 3);
    EXPECT_STREQ(szBuffer, "abcouch");
    EXPECT_EQ(writeToFile("/dev/full", "abc", 3), 0);
    EXPECT_EQ(Errors(),
              (Lines{"QV_Contacts: readFromFile open error = " + ErrorText(ENOENT, ", ") + "\n",
                     "QV_Contacts: writeToFile write error = " + ErrorText(ENOSPC, ", ") + "\n"}));
}

} // namespace
