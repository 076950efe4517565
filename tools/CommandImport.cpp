#include "Common/DataPaths.h"
#include "Core/LocalizerLogic.h"
#include "tools/Commands.h"
#include "tools/ContactDatabase.h"
#include "tools/ContactImport.h"
#include "tools/DataDirectory.h"
#include "tools/ImportEntry.h"
#include "tools/ImportSource.h"
#include "tools/IndexUpdate.h"
#include "tools/InstalledFiles.h"
#include "tools/LibraryLog.h"
#include "tools/LocalizerKeys.h"
#include "tools/PrintableText.h"
#include "tools/Progress.h"
#include "tools/ToolError.h"

#include <CLI/CLI.hpp>
#include <array>
#include <filesystem>
#include <iostream>
#include <map>
#include <memory>
#include <string>
#include <system_error>
#include <vector>

namespace fs = std::filesystem;

namespace
{

const std::map<std::string, IMPORT_FORMAT> FORMATS = {
    {"auto", IMPORT_AUTO}, {"jsonl", IMPORT_JSON}, {"vcard", IMPORT_VCARD}, {"csv", IMPORT_CSV}};

struct tag_ImportOptions
{
    CDataDirectory directory;
    tag_ImportSource source;
    std::string strPinyinTable; // empty: the directory's, or the default if it has none
};

struct tag_Refused
{
    long lLine;
    std::string strReason;
};

// The results of a file's entries.
struct tag_ImportReport
{
    std::array<long, 3> vCount = {}; // by IMPORT_RESULT
    std::vector<tag_Refused> vRefused;
    std::map<std::string, int64_t> groups;
    std::vector<long long> vChangedIds;
};

void ProvidePinyinTable(const std::string& strPinyinTable)
{
    std::error_code error;
    if (!strPinyinTable.empty())
    {
        InstallPinyinTable(strPinyinTable);
    }
    else if (!fs::is_regular_file(CDataPaths::PinyinSource(), error))
    {
        InstallPinyinTable(DefaultPinyinTable());
    }
}

void ApplyEntries(CImportSource& source, CContactImport& import, tag_ImportReport& report)
{
    CProgress progress("Importing contacts");
    std::string strLine;
    long lLine = 0;
    while (source.NextLine(strLine, lLine))
    {
        const tag_ImportEntry entry = ReadImportEntry(strLine, lLine);
        if (!entry.strReason.empty())
        {
            report.vRefused.push_back({entry.lLine, entry.strReason});
            continue;
        }
        ++report.vCount[import.Apply(entry)];
        progress.Set(source.Done(), source.Size());
    }
}

tag_ImportReport ImportFile(const tag_ImportOptions& options)
{
    CImportSource source(options.source);
    options.directory.Create();
    ProvidePinyinTable(options.strPinyinTable);
    tag_ImportReport report;
    CContactDatabase database = CContactDatabase::Extend(CDataPaths::Database());
    CLocalizerKeys keys(!options.strPinyinTable.empty());
    CContactImport import(database, keys);
    ApplyEntries(source, import, report);
    report.groups = import.Groups().Named();
    report.vChangedIds.assign(import.ChangedIds().begin(), import.ChangedIds().end());
    if (report.vCount != std::array<long, 3>())
    {
        database.Commit();
    }
    return report;
}

void PrintReport(const std::string& strFile, const tag_ImportReport& report)
{
    const std::string strShown = strFile == "-" ? "standard input" : PrintableText(strFile);
    for (const tag_Refused& refused : report.vRefused)
    {
        std::cerr << strShown << ":" << refused.lLine
                  << ": refused: " << PrintableText(refused.strReason) << '\n';
    }
    std::cout << strShown << ": " << report.vCount[IMPORT_ADDED] << " added, "
              << report.vCount[IMPORT_UPDATED] << " updated, " << report.vCount[IMPORT_UNCHANGED]
              << " unchanged, " << report.vRefused.size() << " refused\n";
    for (const auto& [strName, llID] : report.groups)
    {
        std::cout << "  group " << llID << "  " << PrintableText(strName) << '\n';
    }
}

// Passes all ids in one call: contacts that are added together are named together, and the library
// rebuilds the index if there are more than it patches. A patch cannot be complete if the database
// was changed before without a notification.
void NotifyOfChanges(std::vector<long long>& vIds)
{
    CLocalizerLogic logic;
    logic.OnContactsTableChanged(static_cast<int>(vIds.size()), vIds.data());
    if (!IsIndexComplete())
    {
        logic.OnContactsTableChanged();
    }
}

void UpdateIndex(const CDataDirectory& directory, tag_ImportReport& report)
{
    const bool bBuild = IsNeedReload() != 0;
    if (bBuild)
    {
        BuildIndex(directory);
    }
    if (bBuild || !report.vChangedIds.empty())
    {
        const CLibraryLog log;
        if (!bBuild)
        {
            NotifyOfChanges(report.vChangedIds);
        }
        PrintCompleteIndex(log);
    }
}

void RunImport(const tag_ImportOptions& options)
{
    options.directory.Use();
    tag_ImportReport report = ImportFile(options);
    PrintReport(options.source.strFile, report);
    std::error_code error;
    if (fs::is_regular_file(CDataPaths::Database(), error))
    {
        UpdateIndex(options.directory, report);
    }
    if (!report.vRefused.empty())
    {
        throw CToolError(TOOL_EXIT_PARTLY, "not everything could be read; the rest was imported");
    }
}

} // namespace

void AddImportCommand(CLI::App& app)
{
    auto pOptions = std::make_shared<tag_ImportOptions>();
    pOptions->source.strConverter = DefaultConverter();
    CLI::App* pCommand = app.add_subcommand(
        "import", "Bring contacts of a vCard, CSV or JSON lines file into the database");
    pOptions->directory.AddOption(*pCommand);
    pCommand->add_option("file", pOptions->source.strFile, "The file; - for standard input")
        ->required();
    pCommand
        ->add_option("--format", pOptions->source.eFormat,
                     "What the file is; auto goes by its name and first bytes")
        ->transform(CLI::CheckedTransformer(FORMATS).description("{auto,csv,jsonl,vcard}"));
    pCommand
        ->add_option("--charset", pOptions->source.strCharset,
                     "Character set of text that does not name its own")
        ->type_name("NAME")
        ->capture_default_str();
    pCommand
        ->add_option("--converter", pOptions->source.strConverter,
                     "Program in Python that turns vCard and CSV into JSON lines")
        ->envname("QV_IMPORT_CONTACTS")
        ->type_name("FILE")
        ->capture_default_str();
    pCommand
        ->add_option("--pyfile", pOptions->strPinyinTable,
                     "Pinyin table to install (default: the directory's, or the one that came "
                     "with the program)")
        ->type_name("FILE");
    pCommand->callback([pOptions] { RunImport(*pOptions); });
}
