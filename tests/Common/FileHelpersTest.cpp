#include "Common/FileHelpers.h"

#include "tests/Support/DataDirectory.h"
#include "tests/Support/WideText.h"

#include <gtest/gtest.h>

#include <filesystem>
#include <iterator>
#include <string>

namespace fs = std::filesystem;

namespace
{

// Names that a shell would make something else of.
const char* const HOSTILE_NAMES[] = {" blank around ",
                                     "quote'in'it",
                                     "$(touch owned)",
                                     "a\ntouch owned",
                                     "back\\slash\\",
                                     "~",
                                     "-rf",
                                     "张三"};

// Each test works with relative names in a directory of its own.
class FileHelpers : public testing::Test
{
protected:
    FileHelpers() : m_pathBefore(fs::current_path()) { fs::current_path(m_clDirectory.Root()); }
    ~FileHelpers() override { fs::current_path(m_pathBefore); }

    static void Make(const std::string& strName) { CDataDirectory::WriteBytes(strName, strName); }
    // How many entries the directory has besides the two that every data directory has.
    static long Entries()
    {
        return std::distance(fs::directory_iterator("."), fs::directory_iterator()) - 2;
    }

private:
    CDataDirectory m_clDirectory;
    fs::path m_pathBefore;
};

} // namespace

TEST_F(FileHelpers, HostileNamesAreOnlyNames)
{
    fs::create_directories("bystander/deep");
    for (const std::string strName : HOSTILE_NAMES)
    {
        SCOPED_TRACE(strName);
        Make(strName);
        EXPECT_EQ(1, _MoveFile(strName.c_str(), "moved"));
        EXPECT_EQ(strName, CDataDirectory::ReadBytes("moved"));
        EXPECT_EQ(1, _wc_MoveFile(L"moved", Wide(strName).c_str()));
        EXPECT_EQ(strName, CDataDirectory::ReadBytes(strName));
        EXPECT_EQ(1, _wc_DeleteFile(Wide(strName).c_str()));
        Make(strName);
        EXPECT_EQ(1, _DeleteFile(strName.c_str()));
        EXPECT_EQ(1, Entries());
    }
    EXPECT_EQ(1, _DeleteFile("bystander"));
    EXPECT_EQ(0, Entries()) << "whole directories";
}

// rm -r 'PATH' is 8 bytes longer than the path and mv 'PATH' 'a' is 9.
TEST_F(FileHelpers, NarrowCommandsStayBelowTheirBuffer)
{
    const auto PathOf = [](size_t uBytes)
    {
        std::string strPath = "./file";
        return strPath.insert(1, uBytes - strPath.size(), '/');
    };
    Make("file");
    EXPECT_EQ(1, _DeleteFile(PathOf(1016).c_str()));
    EXPECT_EQ(1, _MoveFile(PathOf(1015).c_str(), "a"));
    EXPECT_EQ("file", CDataDirectory::ReadBytes("file"));
    EXPECT_EQ(1, _MoveFile(PathOf(1014).c_str(), "a"));
    EXPECT_FALSE(CDataDirectory::Exists("file"));
    EXPECT_EQ(1, _MoveFile("a", PathOf(1014).c_str()));
    EXPECT_EQ(1, _DeleteFile(PathOf(1015).c_str()));
    EXPECT_EQ(0, Entries());
}

TEST(ModuleFileName, IsTheFileThatHoldsTheLibrary)
{
    // The library's code is linked into the test program.
    wchar_t szPath[5000] = {};
    EXPECT_EQ(0, GetModuleFileName(nullptr, szPath, 4096));
    EXPECT_EQ(Wide(fs::read_symlink("/proc/self/exe").string()), szPath);
}
