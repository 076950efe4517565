#include "Common/FileHelpers.h"

#include "Common/Utf8.h"
#include "tests/Support/DataDirectory.h"

#include <gtest/gtest.h>

#include <filesystem>
#include <string>

namespace fs = std::filesystem;

namespace
{

// Names that a shell would make something else of.
const char* const HOSTILE_NAMES[] = {
    "plain",
    "two words",
    " blank around ",
    "quote'in'it",
    "'",
    "double\"quote",
    "$(touch owned)",
    "`touch owned`",
    "$HOME",
    "a; touch owned",
    "a\ntouch owned",
    "back\\slash\\",
    "*",
    "?[a-z]",
    "~",
    "#comment",
    "a & b | c > d",
    "!history",
    "-rf",
    "--help",
    "-",
    "--",
    "张三",
};

std::wstring Wide(const std::string& strText)
{
    std::wstring strWide(strText.size(), L'\0');
    const int iUnits =
        Utf82Unicode(strText.c_str(), strWide.data(), static_cast<int>(strText.size()));
    strWide.resize(static_cast<size_t>(iUnits));
    return strWide;
}

// The narrow and the wide forms, called alike.
struct Helpers
{
    const char* szForm;
    int (*pfnMove)(const std::string&, const std::string&);
    int (*pfnDelete)(const std::string&);
};
const Helpers FORMS[] = {
    {"narrow",
     [](const std::string& strFrom, const std::string& strTo)
     { return _MoveFile(strFrom.c_str(), strTo.c_str()); },
     [](const std::string& strPath) { return _DeleteFile(strPath.c_str()); }},
    {"wide",
     [](const std::string& strFrom, const std::string& strTo)
     { return _wc_MoveFile(Wide(strFrom).c_str(), Wide(strTo).c_str()); },
     [](const std::string& strPath) { return _wc_DeleteFile(Wide(strPath).c_str()); }},
};

// Each test works with relative names in a directory of its own.
class FileHelpers : public testing::Test
{
protected:
    FileHelpers() : m_pathBefore(fs::current_path()) { fs::current_path(m_clDirectory.Root()); }
    ~FileHelpers() override { fs::current_path(m_pathBefore); }

    static void Make(const std::string& strName) { CDataDirectory::WriteBytes(strName, strName); }
    // How many entries the directory has besides the two that every data directory has.
    static int Entries()
    {
        int iCount = -2;
        for (auto it = fs::directory_iterator("."); it != fs::directory_iterator(); ++it)
        {
            ++iCount;
        }
        return iCount;
    }

private:
    CDataDirectory m_clDirectory;
    fs::path m_pathBefore;
};

} // namespace

TEST_F(FileHelpers, HostileNamesAreOnlyNames)
{
    for (const Helpers& form : FORMS)
    {
        for (const std::string strName : HOSTILE_NAMES)
        {
            SCOPED_TRACE(form.szForm + std::string(": ") + strName);
            Make("bystander");
            Make(strName);
            EXPECT_EQ(1, form.pfnMove(strName, "moved"));
            EXPECT_EQ(strName, CDataDirectory::ReadBytes("moved"));
            EXPECT_EQ(2, Entries());
            EXPECT_EQ(1, form.pfnMove("moved", strName));
            EXPECT_EQ(strName, CDataDirectory::ReadBytes(strName));
            EXPECT_EQ(1, form.pfnDelete(strName));
            EXPECT_EQ(1, Entries());
            EXPECT_EQ(1, form.pfnDelete("bystander"));
            EXPECT_EQ(0, Entries());
        }
    }
}

TEST_F(FileHelpers, DeletesWholeDirectories)
{
    for (const Helpers& form : FORMS)
    {
        fs::create_directories("top/a b/deep");
        Make("top/a b/deep/file");
        Make("top/file");
        EXPECT_EQ(1, form.pfnDelete("top"));
        EXPECT_EQ(0, Entries());
    }
}

TEST_F(FileHelpers, FailuresAreNotReported)
{
    testing::internal::CaptureStderr();
    for (const Helpers& form : FORMS)
    {
        EXPECT_EQ(1, form.pfnMove("missing", "target"));
        EXPECT_EQ(1, form.pfnMove("", ""));
        EXPECT_EQ(1, form.pfnDelete("missing"));
        EXPECT_EQ(1, form.pfnDelete(""));
    }
    EXPECT_NE("", testing::internal::GetCapturedStderr());
    EXPECT_EQ(0, Entries());
}

TEST_F(FileHelpers, NullRunsNothing)
{
    Make("file");
    EXPECT_EQ(1, _MoveFile(nullptr, "target"));
    EXPECT_EQ(1, _MoveFile("file", nullptr));
    EXPECT_EQ(1, _DeleteFile(nullptr));
    EXPECT_EQ(1, _wc_MoveFile(nullptr, L"target"));
    EXPECT_EQ(1, _wc_MoveFile(L"file", nullptr));
    EXPECT_EQ(1, _wc_DeleteFile(nullptr));
    EXPECT_EQ("file", CDataDirectory::ReadBytes("file"));
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

TEST_F(FileHelpers, WideCommandsHaveAnyLength)
{
    const std::string strName = "'" + std::string(200, '\'') + "张";
    const std::string strPath = "./" + std::string(3000, '/') + strName;
    Make(strName);
    EXPECT_EQ(1, _wc_MoveFile(Wide(strPath).c_str(), L"moved"));
    EXPECT_EQ(1, _wc_MoveFile(L"moved", Wide(strPath).c_str()));
    EXPECT_EQ(strName, CDataDirectory::ReadBytes(strName));
    EXPECT_EQ(1, _wc_DeleteFile(Wide(strPath).c_str()));
    EXPECT_EQ(0, Entries());
}

TEST(ModuleFileName, IsTheFileThatHoldsTheLibrary)
{
    // The library's code is linked into the test program.
    const std::string strProgram = fs::read_symlink("/proc/self/exe").string();
    wchar_t szPath[5000] = {};
    EXPECT_EQ(0, GetModuleFileName(nullptr, szPath, 4096));
    EXPECT_EQ(Wide(strProgram), szPath);

    wchar_t szCut[5000] = {};
    EXPECT_EQ(0, GetModuleFileName(szCut, szCut, 3));
    EXPECT_EQ(Wide(strProgram).substr(0, 4), szCut);
    EXPECT_EQ(-1, GetModuleFileName(nullptr, nullptr, 4096));
}
