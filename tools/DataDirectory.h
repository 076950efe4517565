#ifndef QV_TOOLS_DATADIRECTORY_H
#define QV_TOOLS_DATADIRECTORY_H

#include <string>

namespace CLI
{
class App;
}

// The directory that a subcommand works in: the one of --data-dir, or the device's.
class CDataDirectory
{
public:
    // Adds --data-dir to the subcommand; the object must live until the subcommand ran.
    void AddOption(CLI::App& command);
    // Makes the library work in the directory; called before anything else of the library.
    void Use() const;
    // Creates databases/ and files/ if they are missing.
    void Create() const;

    // Each throws CToolError if the file is missing or the pinyin table is incomplete; the advice
    // names the subcommand that makes it.
    void RequireDatabase() const;
    void RequirePinyinSource() const;
    void RequireIndex() const;

    // How to call another subcommand for this directory.
    std::string CommandLine(const char* szCommand) const;

private:
    std::string m_strRoot;
};

// Throws CToolError with the advice unless strPath is a file of the pinyin table's size: the
// library accepts any file, and searches with a broken one find no contact.
void RequirePinyinTable(const std::string& strPath, const std::string& strAdvice);

#endif
