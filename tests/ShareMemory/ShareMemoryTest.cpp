#include "MemManager/ShareMemory.h"

#include "tests/Support/ChildProcess.h"
#include "tests/Support/DataDirectory.h"
#include "tests/Support/LogCapture.h"

#include <cerrno>
#include <cstring>
#include <filesystem>
#include <gtest/gtest.h>
#include <regex>
#include <sched.h>
#include <sys/mman.h>
#include <sys/mount.h>
#include <sys/resource.h>
#include <sys/stat.h>
#include <unistd.h>

namespace
{

// The error text as it stands at the end of most lines.
std::string ErrorText(int iError, const char* szBetween = " : ")
{
    return std::to_string(iError) + szBetween + std::strerror(iError);
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

TEST_F(ShareMemory, LeavesTheFileAloneOnAFullDisk)
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
            const std::string strOld(5000, 'x');
            CDataDirectory::WriteBytes(m_strPath, strOld);
            EXPECT_EQ(Open(200000), MAP_FAILED);
            EXPECT_EQ(Errors(), MapError("OpenWriteShareMemory", ENOSPC));
            EXPECT_EQ(CDataDirectory::ReadBytes(m_strPath), strOld);
            // A file with holes is as long as it has to be and still has no place on the disk.
            ASSERT_EQ(truncate(m_strPath.c_str(), 300000), 0);
            EXPECT_EQ(Open(200000), MAP_FAILED);
            // What the failed attempts took is free again.
            EXPECT_NE(Open(40000), MAP_FAILED);
        }));
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
