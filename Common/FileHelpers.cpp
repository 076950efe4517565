#include "Common/FileHelpers.h"

#include "Common/Utf8.h"
#include "Common/WideString.h"

#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <memory>
#include <new>

namespace
{

constexpr const char* MAPS_FILE = "/proc/self/maps";
constexpr const char* EXECUTABLE_MARK = " r-xp ";
constexpr int MAX_MAPS_LINE = 1023;
constexpr int MAX_MAPS_READ = MAX_MAPS_LINE + 2; // with its line end and the terminator

constexpr const char* MOVE_WORDS = "mv";
constexpr const char* DELETE_WORDS = "rm -r";
constexpr const char* ESCAPED_QUOTE = "'\\''";
constexpr size_t ESCAPED_QUOTE_BYTES = 4;
constexpr size_t QUOTING_BYTES = 5; // a blank, two quotes, "./"
constexpr size_t MAX_UTF8_BYTES = 3;

struct CFileCloser
{
    void operator()(FILE* pFile) const { std::fclose(pFile); }
};

// A file of the C library that is read by lines.
class CTextFile
{
public:
    explicit CTextFile(const char* szPath) : m_pFile(std::fopen(szPath, "r")) {}

    bool IsOpen() const { return m_pFile != nullptr; }

    // The next line without its end; empty for one that does not fit. False at the file's end.
    bool ReadLine(char* szLine, int iSize)
    {
        if (std::fgets(szLine, iSize, m_pFile.get()) == nullptr)
        {
            return false;
        }
        char* pEnd = std::strchr(szLine, '\n');
        if (pEnd == nullptr)
        {
            SkipLine();
            pEnd = szLine;
        }
        *pEnd = 0;
        return true;
    }

private:
    void SkipLine()
    {
        int iByte = 0;
        do
        {
            iByte = std::fgetc(m_pFile.get());
        } while (iByte != '\n' && iByte != EOF);
    }

    std::unique_ptr<FILE, CFileCloser> m_pFile;
};

// The path in a line of the list of mappings when the line's range is executable and holds
// uAddress, else null.
const char* PathOfMapping(const char* szLine, uintptr_t uAddress)
{
    const char* szPath = std::strchr(szLine, '/');
    unsigned long ulStart = 0;
    unsigned long ulEnd = 0;
    if (std::strstr(szLine, EXECUTABLE_MARK) == nullptr || szPath == nullptr ||
        std::sscanf(szLine, "%lx-%lx ", &ulStart, &ulEnd) != 2)
    {
        return nullptr;
    }
    return ulStart <= uAddress && uAddress < ulEnd ? szPath : nullptr;
}

// A shell command: words, then quoted paths. Run does nothing if the allocation failed.
class CShellCommand
{
public:
    CShellCommand(const char* szWords, const char* const* pPaths, int iPaths)
        : m_text(new (std::nothrow) char[Room(szWords, pPaths, iPaths)])
    {
        if (m_text == nullptr)
        {
            return;
        }
        AddText(szWords);
        for (int i = 0; i < iPaths; ++i)
        {
            AddPath(pPaths[i]);
        }
    }

    void Run() const
    {
        if (m_text != nullptr)
        {
            // The callers do not report whether the command succeeded.
            const int iStatus = std::system(m_text.get());
            static_cast<void>(iStatus);
        }
    }

private:
    // Bytes for the words, the paths, as if every character were a quote, and the terminator.
    static size_t Room(const char* szWords, const char* const* pPaths, int iPaths)
    {
        size_t uRoom = std::strlen(szWords) + 1;
        for (int i = 0; i < iPaths; ++i)
        {
            uRoom += std::strlen(pPaths[i]) * ESCAPED_QUOTE_BYTES + QUOTING_BYTES;
        }
        return uRoom;
    }

    // Between quotes only a quote is special to the shell; the command would take a name that
    // starts with a dash for an option.
    void AddPath(const char* szPath)
    {
        AddText(szPath[0] == '-' ? " './" : " '");
        for (const char* p = szPath; *p != 0; ++p)
        {
            const char szByte[] = {*p, 0};
            AddText(*p == '\'' ? ESCAPED_QUOTE : szByte);
        }
        AddText("'");
    }

    void AddText(const char* szText)
    {
        const size_t uLength = std::strlen(szText);
        std::memcpy(m_text.get() + m_uUsed, szText, uLength + 1);
        m_uUsed += uLength;
    }

    std::unique_ptr<char[]> m_text;
    size_t m_uUsed = 0;
};

// A wide path in UTF-8; null when the allocation fails.
std::unique_ptr<char[]> Utf8Path(const wchar_t* szPath)
{
    const size_t uUnits = _wcslen(szPath);
    std::unique_ptr<char[]> path(new (std::nothrow) char[(uUnits + 1) * MAX_UTF8_BYTES]());
    if (path != nullptr)
    {
        _wcstombs(path.get(), szPath, static_cast<int>(uUnits));
    }
    return path;
}

// Runs the words with the paths, unless one of them is null.
void RunCommand(const char* szWords, const char* const* pPaths, int iPaths)
{
    for (int i = 0; i < iPaths; ++i)
    {
        if (pPaths[i] == nullptr)
        {
            return;
        }
    }
    CShellCommand(szWords, pPaths, iPaths).Run();
}

} // namespace

int GetModuleFileName(void* /*hModule*/, wchar_t* szPath, int iLastByte)
{
    CTextFile maps(MAPS_FILE);
    if (szPath == nullptr || !maps.IsOpen())
    {
        return -1;
    }
    // A static function lies in this library's text, and another library cannot interpose it. A
    // constant would lie in a mapping that current linkers do not make executable.
    const uintptr_t uOwnText = reinterpret_cast<uintptr_t>(&PathOfMapping);
    int iResult = -1;
    char szLine[MAX_MAPS_READ];
    while (maps.ReadLine(szLine, MAX_MAPS_READ))
    {
        const char* szFound = PathOfMapping(szLine, uOwnText);
        if (szFound != nullptr)
        {
            _mbstowcs(szPath, szFound, iLastByte);
            iResult = 0;
        }
    }
    return iResult;
}

int _MoveFile(const char* szSource, const char* szTarget)
{
    const char* const pPaths[] = {szSource, szTarget};
    RunCommand(MOVE_WORDS, pPaths, 2);
    return 1;
}

int _DeleteFile(const char* szPath)
{
    RunCommand(DELETE_WORDS, &szPath, 1);
    return 1;
}

int _wc_MoveFile(const wchar_t* szSource, const wchar_t* szTarget)
{
    if (szSource != nullptr && szTarget != nullptr)
    {
        const std::unique_ptr<char[]> source = Utf8Path(szSource);
        const std::unique_ptr<char[]> target = Utf8Path(szTarget);
        const char* const pPaths[] = {source.get(), target.get()};
        RunCommand(MOVE_WORDS, pPaths, 2);
    }
    return 1;
}

int _wc_DeleteFile(const wchar_t* szPath)
{
    if (szPath != nullptr)
    {
        const std::unique_ptr<char[]> path = Utf8Path(szPath);
        const char* const pPaths[] = {path.get()};
        RunCommand(DELETE_WORDS, pPaths, 1);
    }
    return 1;
}
