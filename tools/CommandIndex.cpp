#include "tools/Commands.h"

#include "Common/DataPaths.h"
#include "Core/LocalizerCodes.h"
#include "Core/LocalizerLogic.h"
#include "MemManager/MemManger.h"
#include "tools/DataDirectory.h"
#include "tools/LibraryLog.h"
#include "tools/PrintableText.h"
#include "tools/ToolError.h"

#include <CLI/CLI.hpp>

#include <filesystem>
#include <iomanip>
#include <iostream>
#include <memory>
#include <system_error>

namespace fs = std::filesystem;

namespace
{

struct tag_IndexOptions
{
    CDataDirectory directory;
    bool bIfNeeded = false;
};

// A phase of the build by the name that its time is logged under.
struct tag_Phase
{
    const char* szLogName;
    const char* szMeaning;
};

constexpr tag_Phase PHASES[] = {
    {"MemInit IFL_InitalMap", "copy the pinyin table"},
    {"MemInit ReadAllLocalizer", "read the database"},
    {"MemInit IFL_PtrQuickSort", "spell and sort the names"},
    {"MemInit InitContactRecord", "write the store"},
};

std::string FailureText(int iResult)
{
    if (iResult == LOC_ERR_MAP)
    {
        return "the library could not use its pinyin table";
    }
    return "the library could not build the index (result " + std::to_string(iResult) + ")";
}

void BuildIndex(const CDataDirectory& directory, const CLibraryLog& log)
{
    directory.RequireDatabase();
    directory.RequirePinyinSource();
    CLocalizerLogic logic;
    const int iResult = logic.MemInit(true);
    if (iResult != 0)
    {
        throw CToolError(TOOL_EXIT_FAILED, log.WithReason(FailureText(iResult)),
                         "Check that the database is a contacts database, that the files can be "
                         "written and that no other process holds the store.",
                         log.Errors());
    }
}

void PrintPhases(const CLibraryLog& log)
{
    for (const tag_Phase& phase : PHASES)
    {
        std::cout << "  " << std::left << std::setw(26) << phase.szMeaning << std::right
                  << std::setw(6) << log.PhaseTime(phase.szLogName) << " ms\n";
    }
}

void PrintFile(const char* szPath)
{
    std::error_code error;
    const uintmax_t uSize = fs::file_size(szPath, error);
    std::cout << "  " << std::left << std::setw(22) << fs::path(szPath).filename().string()
              << std::right;
    if (error)
    {
        std::cout << "   not there\n";
        return;
    }
    std::cout << std::setw(10) << uSize << " bytes\n";
}

void PrintFiles()
{
    std::cout << "Files in "
              << PrintableText(fs::path(CDataPaths::ContactReg()).parent_path().string()) << ":\n";
    for (const char* szPath : {CDataPaths::PinyinMapping(), CDataPaths::ContactRecords(),
                               CDataPaths::ContactReg(), CDataPaths::LockFile()})
    {
        PrintFile(szPath);
    }
}

void PrintHeading(bool bBuilt)
{
    int iTotal = 0;
    const int iCapacity = CMemManger().GetMemSize(&iTotal);
    std::cout << (bBuilt ? "Index built: " : "The index was there already: ") << iTotal
              << " contacts, room for " << iCapacity << "\n";
}

// Without a capacity the index is damaged, or waits for a build.
bool IsIndexUsable()
{
    int iTotal = 0;
    return IsNeedReload() == 0 && CMemManger().GetMemSize(&iTotal) != 0;
}

void RunIndex(const tag_IndexOptions& options)
{
    options.directory.Use();
    const bool bBuild = !options.bIfNeeded || !IsIndexUsable();
    const CLibraryLog log;
    if (bBuild)
    {
        BuildIndex(options.directory, log);
    }
    PrintHeading(bBuild);
    if (bBuild)
    {
        PrintPhases(log);
    }
    PrintFiles();
}

} // namespace

void AddIndexCommand(CLI::App& app)
{
    auto pOptions = std::make_shared<tag_IndexOptions>();
    CLI::App* pCommand = app.add_subcommand("index", "Build the contact index of the database");
    pOptions->directory.AddOption(*pCommand);
    pCommand->add_flag("--if-needed", pOptions->bIfNeeded,
                       "Leave an index that can be used as it is");
    pCommand->callback([pOptions] { RunIndex(*pOptions); });
}
