#include "tools/DataDirectory.h"

#include "Common/DataPaths.h"
#include "Core/LocalizerLogic.h"
#include "Core/Records/LocalizerCodes.h"
#include "tools/PrintableText.h"
#include "tools/ToolError.h"

#include <CLI/CLI.hpp>
#include <algorithm>
#include <cctype>
#include <cerrno>
#include <cstring>
#include <filesystem>
#include <iomanip>
#include <sstream>
#include <sys/stat.h>
#include <system_error>
#include <unistd.h>

namespace fs = std::filesystem;

namespace
{

// Throws CToolError if the system refuses access, which is not the same as a missing file.
bool IsFile(const std::string& strPath)
{
    std::error_code error;
    const fs::file_status status = fs::status(strPath, error);
    if (status.type() == fs::file_type::none)
    {
        throw CToolError(TOOL_EXIT_FAILED, "cannot look at " + strPath + ": " + error.message());
    }
    return fs::is_regular_file(status);
}

// Creates the directory for the owner alone, since the library gives its files all permission bits.
// An existing directory stays as it is.
void CreateParent(const char* szPath)
{
    const fs::path directory = fs::path(szPath).parent_path();
    std::error_code error;
    fs::create_directories(directory.parent_path(), error);
    if (!error && mkdir(directory.c_str(), S_IRWXU) != 0 && errno != EEXIST)
    {
        error.assign(errno, std::generic_category());
    }
    if (error)
    {
        throw CToolError(TOOL_EXIT_FAILED,
                         "cannot create " + directory.string() + ": " + error.message(),
                         "Choose a directory that you may write with --data-dir.");
    }
}

// A root for the library: absolute, so that the working directory does not matter, and without a
// slash at its end, which would be doubled.
std::string RootOf(const std::string& strDirectory)
{
    std::string strRoot = fs::absolute(strDirectory).lexically_normal().string();
    while (strRoot.size() > 1 && strRoot.back() == '/')
    {
        strRoot.pop_back();
    }
    return strRoot == "/" ? "" : strRoot;
}

bool IsPlain(char c)
{
    return std::isalnum(static_cast<unsigned char>(c)) != 0 ||
           std::strchr("/._-+@%:=,", c) != nullptr;
}

// Quotes a word with unprintable bytes by escapes that bash and zsh read back.
std::string QuotedBytes(const std::string& strWord)
{
    std::ostringstream quoted;
    quoted << "$'" << std::hex << std::setfill('0');
    for (const char c : strWord)
    {
        if (IsPlain(c))
        {
            quoted << c;
        }
        else
        {
            quoted << "\\x" << std::setw(2) << static_cast<int>(static_cast<unsigned char>(c));
        }
    }
    quoted << '\'';
    return quoted.str();
}

// Quotes a word for a shell if that is necessary.
std::string Quoted(const std::string& strWord)
{
    if (std::all_of(strWord.begin(), strWord.end(), IsPlain))
    {
        return strWord;
    }
    if (PrintableText(strWord) != strWord)
    {
        return QuotedBytes(strWord);
    }
    std::string strQuoted = "'";
    for (const char c : strWord)
    {
        strQuoted += c == '\'' ? std::string("'\\''") : std::string(1, c);
    }
    return strQuoted + "'";
}

} // namespace

void CDataDirectory::AddOption(CLI::App& command)
{
    command
        .add_option("--data-dir", m_strRoot,
                    "Directory that holds databases/ and files/ "
                    "(default: /data/data/com.android.providers.contacts)")
        ->type_name("DIR")
        ->check([](const std::string& strDirectory)
                { return strDirectory.empty() ? "the directory has no name" : ""; });
}

void CDataDirectory::Use() const
{
    if (!m_strRoot.empty() && CDataPaths::SetRoot(RootOf(m_strRoot).c_str()) != 0)
    {
        throw CToolError(TOOL_EXIT_USAGE, "the path of the data directory is too long",
                         "Choose a shorter one with --data-dir.");
    }
}

void CDataDirectory::Create() const
{
    CreateParent(CDataPaths::Database());
    CreateParent(CDataPaths::PinyinSource());
}

void CDataDirectory::RequireDatabase() const
{
    if (!IsFile(CDataPaths::Database()))
    {
        throw CToolError(TOOL_EXIT_MISSING,
                         std::string("there is no contacts database ") + CDataPaths::Database(),
                         "Name another directory with --data-dir, or make sample contacts: " +
                             CommandLine("sample"));
    }
}

void CDataDirectory::RequirePinyinSource() const
{
    RequirePinyinTable(CDataPaths::PinyinSource(),
                       "Copy pyfile.bin there, or make sample contacts, which installs it: " +
                           CommandLine("sample"));
    if (access(CDataPaths::PinyinSource(), R_OK | W_OK) != 0)
    {
        throw CToolError(
            TOOL_EXIT_FAILED,
            std::string("the pinyin table cannot be opened for reading and writing, as "
                        "the build of an index does: ") +
                CDataPaths::PinyinSource());
    }
}

void CDataDirectory::RequireIndex() const
{
    if (!IsFile(CDataPaths::ContactReg()) || IsNeedReload() != 0)
    {
        throw CToolError(TOOL_EXIT_MISSING,
                         "the index is not built in " +
                             fs::path(CDataPaths::ContactReg()).parent_path().string(),
                         "Build it first: " + CommandLine("index"));
    }
}

void RequirePinyinTable(const std::string& strPath, const std::string& strAdvice)
{
    if (!IsFile(strPath))
    {
        throw CToolError(TOOL_EXIT_MISSING, "there is no pinyin table " + strPath, strAdvice);
    }
    std::error_code error;
    const uintmax_t uSize = fs::file_size(strPath, error);
    if (error || uSize != PY_FILE_SIZE)
    {
        throw CToolError(TOOL_EXIT_FAILED,
                         strPath + " is not a pinyin table: it has " + std::to_string(uSize) +
                             " bytes, a pinyin table has " + std::to_string(PY_FILE_SIZE),
                         strAdvice);
    }
}

std::string CDataDirectory::CommandLine(const char* szCommand) const
{
    const std::string strLine = std::string("qvlocalize ") + szCommand;
    return m_strRoot.empty() ? strLine : strLine + " --data-dir " + Quoted(m_strRoot);
}
