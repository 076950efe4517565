#include "Common/DataPaths.h"
#include "tools/Commands.h"
#include "tools/ContactDatabase.h"
#include "tools/DataDirectory.h"
#include "tools/InstalledFiles.h"
#include "tools/LocalizerKeys.h"
#include "tools/OptionChecks.h"
#include "tools/PrintableText.h"
#include "tools/Progress.h"
#include "tools/SampleContacts.h"
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

template <typename Test>
auto CountIf(const std::vector<tag_DatabaseContact>& vContacts, Test test)
{
    return std::count_if(vContacts.begin(), vContacts.end(), test);
}

void PrintSummary(const std::vector<tag_DatabaseContact>& vContacts)
{
    using Contact = const tag_DatabaseContact&;
    std::cout << "Wrote " << vContacts.size() << " contacts to "
              << PrintableText(CDataPaths::Database()) << ":\n"
              << "  " << CountIf(vContacts, [](Contact c) { return c.bVisible; }) << " visible, "
              << CountIf(vContacts, [](Contact c) { return c.bStarred; }) << " starred, "
              << CountIf(vContacts, [](Contact c) { return c.bSecret; }) << " secret (group -1), "
              << CountIf(vContacts, [](Contact c) { return c.strStatus == "online"; })
              << " online, groups 1 to " << SAMPLE_GROUPS << ", accounts 1 to " << SAMPLE_ACCOUNTS
              << "\n";
}

void WriteDatabase(std::vector<tag_DatabaseContact>& vContacts)
{
    CProgress progress("Writing contacts");
    CContactDatabase database = CContactDatabase::Replace(CDataPaths::Database());
    CLocalizerKeys keys(true);
    uint64_t uDone = 0;
    for (tag_DatabaseContact& contact : vContacts)
    {
        contact.strKey = keys.KeyOf(contact.strName);
        database.Add(contact);
        progress.Set(++uDone, vContacts.size());
    }
    database.Commit();
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
    std::vector<tag_DatabaseContact> vContacts = MakeSampleContacts(options.iCount, options.llNow);
    WriteDatabase(vContacts);
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
