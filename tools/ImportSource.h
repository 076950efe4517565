#ifndef QV_TOOLS_IMPORTSOURCE_H
#define QV_TOOLS_IMPORTSOURCE_H

#include <cstdint>
#include <cstdio>
#include <memory>
#include <string>
#include <sys/types.h>

enum IMPORT_FORMAT
{
    IMPORT_AUTO, // by the file's name and first bytes
    IMPORT_JSON,
    IMPORT_VCARD,
    IMPORT_CSV,
};

struct tag_ImportSource
{
    std::string strFile; // "-" for standard input
    IMPORT_FORMAT eFormat = IMPORT_AUTO;
    std::string strCharset = "utf-8"; // of text that does not declare its own
    std::string strConverter;         // the program that turns vCard and CSV into JSON lines
};

// Reads a file's contacts as JSON lines, from the file itself or from the converter, a separate
// process that reads the file at the same time. Every operation throws CToolError.
class CImportSource
{
public:
    explicit CImportSource(const tag_ImportSource& source);
    ~CImportSource();
    CImportSource(const CImportSource&) = delete;
    CImportSource& operator=(const CImportSource&) = delete;

    // The next line that is not blank, and its number; false after the last one, when the file and
    // the converter have ended without an error.
    bool NextLine(std::string& strLine, long& lLine);
    // Bytes of the file that have been read, and all of them.
    uint64_t Done() const;
    uint64_t Size() const { return m_uSize; }

private:
    struct Closer
    {
        void operator()(std::FILE* pFile) const { std::fclose(pFile); }
    };
    using FilePtr = std::unique_ptr<std::FILE, Closer>;

    void Open(const std::string& strFile);
    void Spool(FilePtr file);
    IMPORT_FORMAT Format(const tag_ImportSource& source) const;
    void StartConverter(const tag_ImportSource& source, IMPORT_FORMAT eFormat);
    int WaitForConverter();
    void RequireConverted();

    std::string m_strFile;
    FilePtr m_file;  // what the user named, or a copy where that cannot be read twice
    FilePtr m_lines; // the converter's output
    pid_t m_iConverter = 0;
    uint64_t m_uSize = 0;
    long m_lLine = 0;
};

#endif
