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

// What quoting adds, four bytes for each quote, takes nothing from the length of a path. A name
// has at most 255 bytes; repeated slashes make the rest.
TEST_F(FileHelpers, PathsMayBeLongAndFullOfQuotes)
{
    const std::string strQuotes(200, '\'');
    for (const size_t uSlashes : {size_t{815}, size_t{3800}})
    {
        const std::string strPath = "." + std::string(uSlashes, '/') + strQuotes;
        SCOPED_TRACE(strPath.size());
        Make("file");
        EXPECT_EQ(1, _MoveFile("file", strPath.c_str()));
        EXPECT_EQ("file", CDataDirectory::ReadBytes(strQuotes));
        EXPECT_EQ(1, _MoveFile(strPath.c_str(), "file"));
        EXPECT_EQ(1, _MoveFile("file", strPath.c_str()));
        EXPECT_EQ(1, _DeleteFile(strPath.c_str()));
        EXPECT_EQ(0, Entries());
    }
    EXPECT_EQ(1, _MoveFile(nullptr, "file"));
    EXPECT_EQ(1, _DeleteFile(nullptr));
}

TEST(ModuleFileName, IsTheFileThatHoldsTheLibrary)
{
    // The library's code is linked into the test program.
    wchar_t szPath[5000] = {};
    EXPECT_EQ(0, GetModuleFileName(nullptr, szPath, 4096));
    EXPECT_EQ(Wide(fs::read_symlink("/proc/self/exe").string()), szPath);
}
