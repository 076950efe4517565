#include "Common/DataPaths.h"
#include "Core/LocalizerLogic.h"
#include "MemManager/MemManger.h"
#include "tools/Commands.h"
#include "tools/DataDirectory.h"
#include "tools/IndexUpdate.h"
#include "tools/PrintableText.h"

#include <CLI/CLI.hpp>
#include <filesystem>
#include <iomanip>
#include <iostream>
#include <memory>
#include <system_error>
#include <vector>

namespace fs = std::filesystem;

namespace
{

struct tag_IndexOptions
{
    CDataDirectory directory;
    bool bIfNeeded = false;
};

void PrintPhases(const std::vector<tag_IndexPhase>& vPhases)
{
    for (const tag_IndexPhase& phase : vPhases)
    {
        std::cout << "  " << std::left << std::setw(26) << phase.strMeaning << std::right
                  << std::setw(6) << phase.iMilliseconds << " ms\n";
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

// A capacity of 0 means that the index is damaged or marked for a rebuild.
bool IsIndexUsable()
{
    int iTotal = 0;
    return IsNeedReload() == 0 && CMemManger().GetMemSize(&iTotal) != 0;
}

void RunIndex(const tag_IndexOptions& options)
{
    options.directory.Use();
    const bool bBuild = !options.bIfNeeded || !IsIndexUsable();
    const std::vector<tag_IndexPhase> vPhases =
        bBuild ? BuildIndex(options.directory) : std::vector<tag_IndexPhase>();
    PrintHeading(bBuild);
    PrintPhases(vPhases);
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
