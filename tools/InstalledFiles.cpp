#include "tools/InstalledFiles.h"

#include "Common/DataPaths.h"
#include "tools/DataDirectory.h"
#include "tools/ToolError.h"

#include <filesystem>
#include <system_error>

namespace fs = std::filesystem;

namespace
{

// Both paths are relative to the program's directory: an installed program has no path of the
// machine that it was built on.
std::string BuiltOrInstalled(const char* szBuilt, const char* szInstalled)
{
    std::error_code error;
    const fs::path directory = fs::read_symlink("/proc/self/exe", error).parent_path();
    const fs::path installed = (directory / szInstalled).lexically_normal();
    const fs::path built = (directory / szBuilt).lexically_normal();
    return fs::is_regular_file(built, error) ? built.string() : installed.string();
}

} // namespace

std::string DefaultPinyinTable()
{
    return BuiltOrInstalled(QV_TOOL_BUILT_PYFILE, QV_TOOL_DATA "/pyfile.bin");
}

std::string DefaultConverter()
{
    return BuiltOrInstalled("import_contacts.py", QV_TOOL_DATA "/import_contacts.py");
}

void InstallPinyinTable(const std::string& strSource)
{
    RequirePinyinTable(strSource, "Name the file with --pyfile, or build the target qv_pyfile.");
    const char* szTarget = CDataPaths::PinyinSource();
    std::error_code error;
    if (fs::equivalent(strSource, szTarget, error))
    {
        return;
    }
    fs::copy_file(strSource, szTarget, fs::copy_options::overwrite_existing, error);
    if (!error)
    {
        // The library opens its table for writing too, and the copy of a read-only file is one.
        fs::permissions(szTarget, fs::perms::owner_read | fs::perms::owner_write,
                        fs::perm_options::add, error);
    }
    if (error)
    {
        throw CToolError(TOOL_EXIT_FAILED, std::string("cannot copy ") + strSource + " to " +
                                               szTarget + ": " + error.message());
    }
}
