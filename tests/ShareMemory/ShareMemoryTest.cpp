#include "MemManager/ShareMemory.h"

#include "MemManager/MappingGuards.h"
#include "tests/Support/ChildProcess.h"
#include "tests/Support/DataDirectory.h"
#include "tests/Support/LogCapture.h"

#include <cerrno>
#include <cstring>
#include <gtest/gtest.h>
#include <sched.h>
#include <sys/mount.h>
#include <sys/resource.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

namespace
{

constexpr int ERROR_LINE = 6;

// The error text as it stands at the end of most lines.
std::string ErrorText(int iError, const char* szBetween = " : ")
{
    return std::to_string(iError) + szBetween + std::strerror(iError);
}

mode_t PermissionBits(const std::string& strPath)
{
    struct stat info = {};
    EXPECT_EQ(stat(strPath.c_str(), &info), 0);
    return info.st_mode & 0777;
}

// Whether there is exactly one line, an error, that begins and ends so; the descriptor's number
// stands in between.
bool HasOneError(const CLogCapture& log, const std::string& strBegin, const std::string& strEnd)
{
    const std::vector<std::string> vTexts = log.Texts(ERROR_LINE);
    if (log.Lines().size() != 1 || vTexts.size() != 1 || log.Lines()[0].strTag != "QV_Localize")
    {
        return false;
    }
    const std::string& strText = vTexts[0];
    return strText.size() >= strBegin.size() + strEnd.size() &&
           strText.compare(0, strBegin.size(), strBegin) == 0 &&
           strText.compare(strText.size() - strEnd.size(), strEnd.size(), strEnd) == 0;
}

struct tag_WriteOpen
{
    const char* szName;
    void* (*pfnOpen)(const char*, size_t);
};
std::ostream& operator<<(std::ostream& stream, const tag_WriteOpen& open)
{
    return stream << open.szName;
}

class ShareMemory : public testing::Test
{
protected:
    CDataDirectory m_directory;
    CLogCapture m_log;
    std::string m_strPath = m_directory.File("shared.bin");
};

class WriteOpen : public ShareMemory, public testing::WithParamInterface<tag_WriteOpen>
{
protected:
    void* Open(size_t uSize) { return GetParam().pfnOpen(m_strPath.c_str(), uSize); }
    std::string MapLine() const
    {
        return std::string("QV_Contacts: ") + GetParam().szName + ":" + m_strPath + ", hFile=";
    }
};

INSTANTIATE_TEST_SUITE_P(Both, WriteOpen,
                         testing::Values(tag_WriteOpen{"OpenShareMemory", &OpenShareMemory},
                                         tag_WriteOpen{"OpenWriteShareMemory",
                                                       &OpenWriteShareMemory}),
                         [](const auto& entry) { return std::string(entry.param.szName); });

TEST_P(WriteOpen, GivesFilesTheirSizeAndALastZero)
{
    const struct
    {
        std::string strBefore;
        std::string strAfter;
    } cases[] = {
        {"", std::string(12, '\0')},
        {"short", std::string("short") + std::string(7, '\0')},
        {std::string(12, 'x'), std::string(11, 'x') + '\0'},
        {std::string(100, 'x'), std::string(11, 'x') + '\0' + std::string(88, 'x')},
    };
    for (const auto& entry : cases)
    {
        CDataDirectory::WriteBytes(m_strPath, entry.strBefore);
        void* pAddr = Open(12);
        ASSERT_NE(pAddr, MAP_FAILED);
        EXPECT_EQ(CDataDirectory::ReadBytes(m_strPath), entry.strAfter);
        static_cast<char*>(pAddr)[0] = 'W';
        CloseWriteShareMemory(pAddr, 12, 0);
        EXPECT_EQ(CDataDirectory::ReadBytes(m_strPath)[0], 'W');
    }
    EXPECT_TRUE(m_log.Lines().empty());
}

TEST_P(WriteOpen, CreatesForEverybodyAndLeavesTheMaskAtZero)
{
    const mode_t iOldMask = umask(077);
    void* pAddr = Open(12);
    EXPECT_EQ(umask(iOldMask), 0U);
    ASSERT_NE(pAddr, MAP_FAILED);
    EXPECT_EQ(PermissionBits(m_strPath), 0777U);
    CloseShareMemory(pAddr, 12);
}

TEST_P(WriteOpen, TellsWhyAFileCannotBeOpened)
{
    m_strPath = m_directory.File("no/such/directory");
    EXPECT_EQ(Open(12), MAP_FAILED);
    const bool bWithPath = std::string(GetParam().szName) == "OpenWriteShareMemory";
    EXPECT_EQ(m_log.Texts(ERROR_LINE),
              std::vector<std::string>{std::string("QV_Contacts: ") + GetParam().szName +
                                       (bWithPath ? " " + m_strPath : "") +
                                       " error no2 = " + std::to_string(ENOENT) + "\n"});
    EXPECT_EQ(GetParam().pfnOpen(nullptr, 12), MAP_FAILED);
}

TEST_P(WriteOpen, NeverMapsNothing)
{
    EXPECT_EQ(Open(0), MAP_FAILED);
    EXPECT_TRUE(HasOneError(m_log, MapLine(), ", error:" + ErrorText(EINVAL)));
    EXPECT_EQ(Open(SIZE_MAX), MAP_FAILED);
    EXPECT_EQ(CDataDirectory::ReadBytes(m_strPath), "");
}

// The signal that comes with passing the limit would end the child.
TEST_P(WriteOpen, RefusesASizeAboveTheProcessLimit)
{
    for (const size_t uOld : {size_t{0}, size_t{3000}, size_t{6000}})
    {
        CDataDirectory::WriteBytes(m_strPath, std::string(uOld, 'x'));
        EXPECT_TRUE(RunInChild(
            [&]
            {
                const rlimit limit = {4096, 4096};
                ASSERT_EQ(setrlimit(RLIMIT_FSIZE, &limit), 0);
                m_log.Clear();
                EXPECT_EQ(Open(5000), MAP_FAILED);
                EXPECT_TRUE(HasOneError(m_log, MapLine(), ", error:" + ErrorText(EFBIG)));
            }))
            << uOld;
        EXPECT_EQ(CDataDirectory::ReadBytes(m_strPath), std::string(uOld, 'x'));
    }
    EXPECT_TRUE(RunInChild(
        [&]
        {
            const rlimit limit = {4096, 4096};
            ASSERT_EQ(setrlimit(RLIMIT_FSIZE, &limit), 0);
            EXPECT_NE(Open(4096), MAP_FAILED);
        }));
}

// A file system of 64 KiB that only the child sees.
bool MountSmallDisk(const std::string& strDirectory)
{
    return unshare(CLONE_NEWNS) == 0 && mount("none", "/", nullptr, MS_REC | MS_PRIVATE, "") == 0 &&
           mount("none", strDirectory.c_str(), "tmpfs", 0, "size=64k,mode=0777") == 0;
}

TEST_P(WriteOpen, LeavesTheFileAloneOnAFullDisk)
{
    constexpr int NO_MOUNT = 77;
    const int iStatus = StatusOfChild(
        [&]
        {
            if (!MountSmallDisk(m_directory.File("")))
            {
                _exit(NO_MOUNT);
            }
            m_log.Clear();
            const std::string strOld(5000, 'x');
            CDataDirectory::WriteBytes(m_strPath, strOld);
            EXPECT_EQ(Open(200000), MAP_FAILED);
            EXPECT_TRUE(HasOneError(m_log, MapLine(), ", error:" + ErrorText(ENOSPC)));
            EXPECT_EQ(CDataDirectory::ReadBytes(m_strPath), strOld);
            // A file with holes is as long as it has to be and still has no place on the disk.
            ASSERT_EQ(truncate(m_strPath.c_str(), 300000), 0);
            EXPECT_EQ(Open(200000), MAP_FAILED);
            // What the failed attempts took is free again.
            EXPECT_NE(Open(40000), MAP_FAILED);
        });
    if (WIFEXITED(iStatus) && WEXITSTATUS(iStatus) == NO_MOUNT)
    {
        GTEST_SKIP() << "this user cannot mount";
    }
    EXPECT_EQ(iStatus, 0);
}

TEST_F(ShareMemory, ReadsWhatAnotherProcessWrote)
{
    EXPECT_TRUE(RunInChild(
        [&]
        {
            CWriteMapping mapping(m_strPath.c_str(), 5000);
            ASSERT_TRUE(mapping.IsOpen());
            std::memset(mapping.As<char>(), 'w', 5000);
        }));
    CReadMapping mapping(m_strPath.c_str(), 5000);
    ASSERT_TRUE(mapping.IsOpen());
    EXPECT_EQ(std::string(mapping.As<char>(), 5000), std::string(5000, 'w'));
    mapping.Close();
    EXPECT_FALSE(mapping.IsOpen());
    EXPECT_TRUE(m_log.Lines().empty());
}

TEST_F(ShareMemory, ReadingCreatesNothingAndStopsAtTheEnd)
{
    EXPECT_EQ(OpenReadShareMemory(m_strPath.c_str(), 12), MAP_FAILED);
    EXPECT_EQ(m_log.Texts(ERROR_LINE),
              std::vector<std::string>{"QV_Contacts: OpenReadShareMemory:" + m_strPath +
                                       " error no2 = " + std::to_string(ENOENT) + "\n"});
    EXPECT_FALSE(CDataDirectory::Exists(m_strPath));
    EXPECT_EQ(OpenReadShareMemory(nullptr, 12), MAP_FAILED);

    const struct
    {
        std::string strContent;
        size_t uSize;
        int iError;
    } cases[] = {
        {"", 12, ENXIO},
        {"", 0, EINVAL},
        {std::string(11, 'x'), 12, ENXIO},
        {std::string(11, 'x'), 0, EINVAL},
        {std::string(11, 'x'), SIZE_MAX, ENXIO},
    };
    for (const auto& entry : cases)
    {
        m_log.Clear();
        CDataDirectory::WriteBytes(m_strPath, entry.strContent);
        EXPECT_EQ(OpenReadShareMemory(m_strPath.c_str(), entry.uSize), MAP_FAILED);
        EXPECT_TRUE(HasOneError(m_log, "QV_Contacts: OpenReadShareMemory:" + m_strPath + ", hFile=",
                                ", error:" + ErrorText(entry.iError)))
            << entry.uSize;
        EXPECT_EQ(CDataDirectory::ReadBytes(m_strPath), entry.strContent);
    }
    m_log.Clear();
    EXPECT_EQ(OpenReadShareMemory(m_directory.File("").c_str(), 12), MAP_FAILED);
    EXPECT_EQ(m_log.Texts(ERROR_LINE).size(), 1U);
}

TEST_F(ShareMemory, ClosingTellsWhatFailed)
{
    CloseShareMemory(nullptr, 12);
    CloseWriteShareMemory(nullptr, 12, 1);
    EXPECT_EQ(CloseReadShareMemory(nullptr, 12), 0);
    EXPECT_TRUE(m_log.Lines().empty());

    // An address inside a page belongs to no mapping.
    char* pPage =
        static_cast<char*>(mmap(nullptr, 4096, PROT_READ, MAP_PRIVATE | MAP_ANONYMOUS, -1, 0));
    ASSERT_NE(static_cast<void*>(pPage), MAP_FAILED);
    CloseShareMemory(pPage + 1, 12);
    CloseWriteShareMemory(pPage + 1, 12, 0);
    EXPECT_NE(CloseReadShareMemory(pPage + 1, 12), 0);
    const std::string strError = ErrorText(EINVAL, "=");
    const std::vector<std::string> vExpected = {
        "QV_Contacts: CloseShareMemory msync error:" + strError,
        "QV_Contacts: CloseShareMemory munmap error:" + strError,
        "QV_Contacts: CloseWriteShareMemory msync error:" + strError,
        "QV_Contacts: CloseWriteShareMemory munmap error:" + strError,
        "QV_Contacts: CloseReadShareMemory munmap error:" + strError,
    };
    EXPECT_EQ(m_log.Texts(ERROR_LINE), vExpected);
    EXPECT_EQ(CloseReadShareMemory(pPage, 4096), 0);
}

TEST_F(ShareMemory, WritesWholeFiles)
{
    EXPECT_EQ(writeToFile(m_strPath.c_str(), "x", -1), 0);
    EXPECT_EQ(writeToFile(m_strPath.c_str(), nullptr, 1), 0);
    EXPECT_EQ(writeToFile(nullptr, "x", 1), 0);
    EXPECT_FALSE(CDataDirectory::Exists(m_strPath));
    EXPECT_TRUE(m_log.Lines().empty());

    EXPECT_EQ(writeToFile(m_strPath.c_str(), "longer", 6), 1);
    EXPECT_EQ(writeToFile(m_strPath.c_str(), "abc", 3), 1);
    EXPECT_EQ(CDataDirectory::ReadBytes(m_strPath), "abc");
    EXPECT_EQ(writeToFile(m_strPath.c_str(), "", 0), 1);
    EXPECT_EQ(CDataDirectory::ReadBytes(m_strPath), "");

    EXPECT_EQ(writeToFile(m_directory.File("").c_str(), "abc", 3), 0);
    EXPECT_EQ(writeToFile("/dev/full", "abc", 3), 0);
    const std::vector<std::string> vExpected = {
        "QV_Contacts: writeToFile open error = " + ErrorText(EISDIR, ", ") + "\n",
        "QV_Contacts: writeToFile write error = " + ErrorText(ENOSPC, ", ") + "\n",
    };
    EXPECT_EQ(m_log.Texts(ERROR_LINE), vExpected);
}

TEST_F(ShareMemory, ReadsWholeFiles)
{
    char szBuffer[8] = "untouch";
    int iLen = 8;
    EXPECT_EQ(readFromFile(m_strPath.c_str(), szBuffer, &iLen), 0);
    EXPECT_EQ(iLen, 8);
    EXPECT_EQ(m_log.Texts(ERROR_LINE),
              std::vector<std::string>{
                  "QV_Contacts: readFromFile open error = " + ErrorText(ENOENT, ", ") + "\n"});
    EXPECT_EQ(readFromFile(nullptr, szBuffer, &iLen), 0);
    EXPECT_EQ(readFromFile(m_strPath.c_str(), nullptr, &iLen), 0);
    EXPECT_EQ(readFromFile(m_strPath.c_str(), szBuffer, nullptr), 0);

    CDataDirectory::WriteBytes(m_strPath, "abcdef");
    const struct
    {
        int iAsked;
        int iResult;
        int iRead;
    } cases[] = {{4, 1, 4}, {8, 1, 6}, {0, 1, 0}, {-1, 0, -1}};
    for (const auto& entry : cases)
    {
        iLen = entry.iAsked;
        EXPECT_EQ(readFromFile(m_strPath.c_str(), szBuffer, &iLen), entry.iResult);
        EXPECT_EQ(iLen, entry.iRead);
    }
    EXPECT_EQ(std::string(szBuffer, 6), "abcdef");
    iLen = 8;
    EXPECT_EQ(readFromFile(m_directory.File("").c_str(), szBuffer, &iLen), 1);
    EXPECT_EQ(iLen, -1);
}

} // namespace
