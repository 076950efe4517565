#include "tools/Commands.h"

#include "Common/DataPaths.h"
#include "tools/DataDirectory.h"
#include "tools/LocalizerKeys.h"
#include "tools/OptionChecks.h"
#include "tools/PrintableText.h"
#include "tools/SampleContacts.h"
#include "tools/SampleDatabase.h"
#include "tools/ToolError.h"

#include <CLI/CLI.hpp>

#include <algorithm>
#include <filesystem>
#include <iostream>
#include <memory>
#include <system_error>

namespace fs = std::filesystem;

namespace
{

constexpr int DEFAULT_CONTACTS = 600;
constexpr int MAX_CONTACTS = 200000;
constexpr int64_t DEFAULT_NOW_MS = 1735689600000; // the first day of 2025, UTC

// The table that was installed with the program, else the one of its build, by their places beside
// the program: an installed program knows nothing of the machine that it was built on.
std::string DefaultPinyinTable()
{
    std::error_code error;
    const fs::path directory = fs::read_symlink("/proc/self/exe", error).parent_path();
    const fs::path installed = (directory / QV_TOOL_INSTALLED_PYFILE).lexically_normal();
    const fs::path built = (directory / QV_TOOL_BUILT_PYFILE).lexically_normal();
    return fs::is_regular_file(built, error) ? built.string() : installed.string();
}

struct tag_SampleOptions
{
    CDataDirectory directory;
    std::string strPinyinTable = DefaultPinyinTable();
    int iCount = DEFAULT_CONTACTS;
    int64_t llNow = DEFAULT_NOW_MS;
    bool bForce = false;
};

void RefuseToReplace()
{
    std::error_code error;
    if (fs::exists(CDataPaths::Database(), error))
    {
        throw CToolError(TOOL_EXIT_USAGE,
                         std::string("there is a database already: ") + CDataPaths::Database(),
                         "Choose another directory with --data-dir, or replace it with --force.");
    }
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

template <typename Test>
auto CountIf(const std::vector<tag_SampleContact>& vContacts, Test test)
{
    return std::count_if(vContacts.begin(), vContacts.end(), test);
}

void PrintSummary(const std::vector<tag_SampleContact>& vContacts)
{
    using Contact = const tag_SampleContact&;
    std::cout << "Wrote " << vContacts.size() << " contacts to "
              << PrintableText(CDataPaths::Database()) << ":\n"
              << "  " << CountIf(vContacts, [](Contact c) { return c.bVisible; }) << " visible, "
              << CountIf(vContacts, [](Contact c) { return c.bStarred; }) << " starred, "
              << CountIf(vContacts, [](Contact c) { return c.bSecret; }) << " secret (group -1), "
              << CountIf(vContacts, [](Contact c) { return c.strStatus == "online"; })
              << " online, groups 1 to " << SAMPLE_GROUPS << ", accounts 1 to " << SAMPLE_ACCOUNTS
              << "\n";
}

void RunSample(const tag_SampleOptions& options)
{
    options.directory.Use();
    if (!options.bForce)
    {
        RefuseToReplace();
    }
    options.directory.Create();
    InstallPinyinTable(options.strPinyinTable);
    std::vector<tag_SampleContact> vContacts = MakeSampleContacts(options.iCount, options.llNow);
    FillLocalizerKeys(vContacts);
    WriteSampleDatabase(CDataPaths::Database(), vContacts);
    PrintSummary(vContacts);
    std::cout << "Next: " << options.directory.CommandLine("index") << "\n";
}

} // namespace

void AddSampleCommand(CLI::App& app)
{
    auto pOptions = std::make_shared<tag_SampleOptions>();
    CLI::App* pCommand =
        app.add_subcommand("sample", "Make a provider database of sample contacts");
    pOptions->directory.AddOption(*pCommand);
    pCommand->add_option("--pyfile", pOptions->strPinyinTable, "Pinyin table to install")
        ->type_name("FILE")
        ->capture_default_str();
    pCommand
        ->add_option("--count", pOptions->iCount,
                     "Number of contacts, 1 to " + std::to_string(MAX_CONTACTS))
        ->type_name("N")
        ->check(WholeNumber(1, MAX_CONTACTS))
        ->capture_default_str();
    pCommand
        ->add_option("--now", pOptions->llNow,
                     "Time in milliseconds since 1970 that the last contacts go back from")
        ->type_name("MS")
        ->check(WholeNumber(0, MAX_TIME_MS))
        ->capture_default_str();
    pCommand->add_flag("--force", pOptions->bForce, "Replace a database that is there");
    pCommand->callback([pOptions] { RunSample(*pOptions); });
}
