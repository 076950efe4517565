#include "tools/IndexUpdate.h"

#include "Core/LocalizerLogic.h"
#include "Core/Records/LocalizerCodes.h"
#include "MemManager/MemManger.h"
#include "tools/DataDirectory.h"
#include "tools/LibraryLog.h"
#include "tools/Progress.h"
#include "tools/ToolError.h"

#include <iostream>
#include <iterator>

namespace
{

// A phase of the build by the name that its time is logged under.
struct tag_LoggedPhase
{
    const char* szLogName;
    const char* szMeaning;
};

constexpr tag_LoggedPhase PHASES[] = {
    {"MemInit IFL_InitalMap", "copy the pinyin table"},
    {"MemInit ReadAllLocalizer", "read the database"},
    {"MemInit IFL_PtrQuickSort", "spell and sort the names"},
    {"MemInit InitContactRecord", "write the store"},
};

// Shows the phases of a build on the terminal.
class CBuildProgress
{
public:
    void EndPhase()
    {
        m_progress.Set(++m_uEnded, std::size(PHASES));
        if (m_uEnded < std::size(PHASES))
        {
            m_progress.Doing(PHASES[m_uEnded].szMeaning);
        }
    }

private:
    CProgress m_progress{PHASES[0].szMeaning};
    size_t m_uEnded = 0;
};

std::string FailureText(int iResult)
{
    if (iResult == LOC_ERR_MAP)
    {
        return "the library could not use its pinyin table";
    }
    return "the library could not build the index (result " + std::to_string(iResult) + ")";
}

} // namespace

std::vector<tag_IndexPhase> BuildIndex(const CDataDirectory& directory)
{
    directory.RequireDatabase();
    directory.RequirePinyinSource();
    CBuildProgress progress;
    const CLibraryLog log([&progress] { progress.EndPhase(); });
    CLocalizerLogic logic;
    const int iResult = logic.MemInit(true);
    if (iResult != 0)
    {
        throw CToolError(TOOL_EXIT_FAILED, log.WithReason(FailureText(iResult)),
                         "Check that the database is a contacts database, that the files can be "
                         "written and that no other process holds the store.",
                         log.Errors());
    }
    std::vector<tag_IndexPhase> vPhases;
    for (const tag_LoggedPhase& phase : PHASES)
    {
        vPhases.push_back({phase.szMeaning, log.PhaseTime(phase.szLogName)});
    }
    return vPhases;
}

bool IsIndexComplete()
{
    int iTotal = 0;
    const int iCapacity = CMemManger().GetMemSize(&iTotal);
    return iCapacity != 0 && iTotal <= iCapacity;
}

void PrintCompleteIndex(const CLibraryLog& log)
{
    if (!IsIndexComplete())
    {
        throw CToolError(
            TOOL_EXIT_FAILED, log.WithReason("the index does not hold what the database holds"),
            "The next notification of contacts or status builds it anew.", log.Errors());
    }
    int iTotal = 0;
    const int iCapacity = CMemManger().GetMemSize(&iTotal);
    std::cout << "The index holds " << iTotal << " contacts, with room for " << iCapacity << '\n';
}
