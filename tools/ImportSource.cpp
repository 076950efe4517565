#include "tools/ImportSource.h"

#include "tools/ToolError.h"

#include <array>
#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <fcntl.h>
#include <filesystem>
#include <spawn.h>
#include <strings.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

namespace fs = std::filesystem;

namespace
{

constexpr size_t LOOKED_AT = 4096;                         // bytes that identify the format
constexpr const char* DEBIANS_PYTHON = "/usr/bin/python3"; // the interpreter with Debian's packages
constexpr const char* ANY_PYTHON = "python3";
constexpr const char* BYTE_ORDER_MARK = "\xEF\xBB\xBF";
constexpr int NO_VOBJECT = 3;   // exit status of the converter without its package
constexpr int NO_PROGRAM = 127; // exit status of a child whose program cannot be run

struct tag_NamedFormat
{
    const char* szEnd; // of a file's name
    IMPORT_FORMAT eFormat;
};

constexpr tag_NamedFormat FORMATS_BY_NAME[] = {
    {".vcf", IMPORT_VCARD},   {".vcard", IMPORT_VCARD}, {".csv", IMPORT_CSV},  {".tsv", IMPORT_CSV},
    {".ndjson", IMPORT_JSON}, {".jsonl", IMPORT_JSON},  {".json", IMPORT_JSON}};

[[noreturn]] void Fail(const std::string& strDoing, const std::string& strFile)
{
    const int iError = errno;
    throw CToolError(iError == ENOENT ? TOOL_EXIT_MISSING : TOOL_EXIT_FAILED,
                     "cannot " + strDoing + " " + strFile + ": " + std::strerror(iError));
}

[[noreturn]] void MissPackage(const std::string& strWhat, const std::string& strPackages)
{
    throw CToolError(TOOL_EXIT_MISSING, strWhat,
                     "Install it: apt install " + strPackages +
                         "; files of JSON lines are imported without.");
}

IMPORT_FORMAT FormatOfContent(const std::string& strBegin)
{
    const size_t uMark = strBegin.compare(0, 3, BYTE_ORDER_MARK) == 0 ? 3 : 0;
    const size_t uText = strBegin.find_first_not_of(" \t\r\n", uMark);
    if (uText != std::string::npos && strBegin[uText] == '{')
    {
        return IMPORT_JSON;
    }
    return strcasestr(strBegin.c_str(), "BEGIN:VCARD") != nullptr ? IMPORT_VCARD : IMPORT_CSV;
}

} // namespace

CImportSource::CImportSource(const tag_ImportSource& source)
    : m_strFile(source.strFile == "-" ? "standard input" : source.strFile)
{
    Open(source.strFile);
    const IMPORT_FORMAT eFormat = Format(source);
    if (eFormat != IMPORT_JSON)
    {
        StartConverter(source, eFormat);
    }
}

CImportSource::~CImportSource()
{
    m_lines.reset(); // ends a converter that is still writing
    WaitForConverter();
}

void CImportSource::Open(const std::string& strFile)
{
    const int iInput = strFile == "-" ? fcntl(STDIN_FILENO, F_DUPFD_CLOEXEC, 0)
                                      : open(strFile.c_str(), O_RDONLY | O_CLOEXEC);
    m_file.reset(iInput < 0 ? nullptr : fdopen(iInput, "r"));
    struct stat status = {};
    if (!m_file || fstat(fileno(m_file.get()), &status) != 0)
    {
        Fail("read", m_strFile);
    }
    if (strFile == "-" || !S_ISREG(status.st_mode))
    {
        Spool(std::move(m_file));
    }
    if (fstat(fileno(m_file.get()), &status) == 0)
    {
        m_uSize = static_cast<uint64_t>(status.st_size);
    }
}

void CImportSource::Spool(FilePtr file)
{
    m_file.reset(std::tmpfile());
    if (!m_file)
    {
        Fail("make a temporary copy of", m_strFile);
    }
    fcntl(fileno(m_file.get()), F_SETFD, FD_CLOEXEC);
    std::array<char, LOOKED_AT> block;
    size_t uRead = 0;
    while ((uRead = std::fread(block.data(), 1, block.size(), file.get())) > 0)
    {
        if (std::fwrite(block.data(), 1, uRead, m_file.get()) != uRead)
        {
            Fail("make a temporary copy of", m_strFile);
        }
    }
    if (std::ferror(file.get()) != 0)
    {
        Fail("read", m_strFile);
    }
    if (std::fflush(m_file.get()) != 0 || std::fseek(m_file.get(), 0, SEEK_SET) != 0)
    {
        Fail("make a temporary copy of", m_strFile);
    }
}

IMPORT_FORMAT CImportSource::Format(const tag_ImportSource& source) const
{
    if (source.eFormat != IMPORT_AUTO)
    {
        return source.eFormat;
    }
    const std::string strEnd = fs::path(source.strFile).extension().string();
    for (const tag_NamedFormat& format : FORMATS_BY_NAME)
    {
        if (strcasecmp(format.szEnd, strEnd.c_str()) == 0)
        {
            return format.eFormat;
        }
    }
    std::string strBegin(LOOKED_AT, '\0');
    const ssize_t iRead = pread(fileno(m_file.get()), strBegin.data(), strBegin.size(), 0);
    strBegin.resize(iRead < 0 ? 0 : static_cast<size_t>(iRead));
    return FormatOfContent(strBegin);
}

void CImportSource::StartConverter(const tag_ImportSource& source, IMPORT_FORMAT eFormat)
{
    std::error_code error;
    if (!fs::is_regular_file(source.strConverter, error))
    {
        throw CToolError(TOOL_EXIT_MISSING, "there is no converter " + source.strConverter,
                         "Name import_contacts.py with --converter.");
    }
    std::array<int, 2> pipeEnds = {};
    if (pipe2(pipeEnds.data(), O_CLOEXEC) != 0)
    {
        Fail("run a converter for", m_strFile);
    }
    m_lines.reset(fdopen(pipeEnds[0], "r"));
    std::string strProgram = access(DEBIANS_PYTHON, X_OK) == 0 ? DEBIANS_PYTHON : ANY_PYTHON;
    std::string strNoCache = "-B";
    std::string strConverter = source.strConverter;
    std::string strFormat = eFormat == IMPORT_CSV ? "csv" : "vcard";
    std::string strCharset = source.strCharset;
    std::array<char*, 6> arguments = {strProgram.data(), strNoCache.data(), strConverter.data(),
                                      strFormat.data(),  strCharset.data(), nullptr};
    posix_spawn_file_actions_t actions;
    posix_spawn_file_actions_init(&actions);
    posix_spawn_file_actions_adddup2(&actions, fileno(m_file.get()), STDIN_FILENO);
    posix_spawn_file_actions_adddup2(&actions, pipeEnds[1], STDOUT_FILENO);
    const int iResult =
        posix_spawnp(&m_iConverter, arguments[0], &actions, nullptr, arguments.data(), environ);
    posix_spawn_file_actions_destroy(&actions);
    close(pipeEnds[1]);
    if (iResult == ENOENT)
    {
        MissPackage("python3, which reads vCard and CSV, is not installed",
                    "python3 python3-vobject");
    }
    if (iResult != 0 || !m_lines)
    {
        errno = iResult;
        Fail("run a converter for", m_strFile);
    }
}

// The exit status of the converter, 0 if none ran.
int CImportSource::WaitForConverter()
{
    int iStatus = 0;
    if (m_iConverter > 0)
    {
        while (waitpid(m_iConverter, &iStatus, 0) < 0 && errno == EINTR)
        {
        }
        m_iConverter = 0;
    }
    return WIFEXITED(iStatus) ? WEXITSTATUS(iStatus) : -1;
}

void CImportSource::RequireConverted()
{
    switch (WaitForConverter())
    {
    case 0:
        return;
    case NO_VOBJECT:
        MissPackage("python3 lacks vobject, which reads vCards", "python3-vobject");
    case NO_PROGRAM:
        MissPackage("python3, which reads vCard and CSV, is not installed",
                    "python3 python3-vobject");
    default:
        throw CToolError(TOOL_EXIT_FAILED, "the converter did not end well with " + m_strFile,
                         "Nothing was imported.");
    }
}

bool CImportSource::NextLine(std::string& strLine, long& lLine)
{
    std::FILE* pLines = m_lines ? m_lines.get() : m_file.get();
    char* pBuffer = nullptr;
    size_t uSize = 0;
    ssize_t iLength = 0;
    strLine.clear();
    while (strLine.find_first_not_of(" \t\r\n") == std::string::npos && iLength >= 0)
    {
        iLength = getline(&pBuffer, &uSize, pLines);
        ++m_lLine;
        strLine.assign(pBuffer, iLength < 0 ? 0 : static_cast<size_t>(iLength));
    }
    std::free(pBuffer);
    lLine = m_lLine;
    if (iLength < 0 && std::ferror(pLines) != 0)
    {
        Fail("read", m_strFile);
    }
    if (iLength < 0)
    {
        RequireConverted();
        return false;
    }
    if (m_lLine == 1 && strLine.compare(0, 3, BYTE_ORDER_MARK) == 0)
    {
        strLine.erase(0, 3);
    }
    return true;
}

uint64_t CImportSource::Done() const
{
    // The converter reads through the same open file.
    const off_t iOffset = lseek(fileno(m_file.get()), 0, SEEK_CUR);
    return iOffset < 0 ? 0 : static_cast<uint64_t>(iOffset);
}
