#ifndef QV_TOOLS_FILTEROPTIONS_H
#define QV_TOOLS_FILTEROPTIONS_H

#include "Filter/FilterChain.h"

#include <memory>
#include <string>
#include <vector>

class CLocalizerLogic;
namespace CLI
{
class App;
}

// One filter of the command line.
struct tag_ChosenFilter
{
    std::string strName; // of the option, without dashes
    int iKind;
    bool bHasID;
    int iID; // of a group, account or contact; 0 where the filter takes none
};

// The library's chain of filters. Throws CToolError.
std::unique_ptr<CFilterChain> MakeFilterChain(CLocalizerLogic& logic,
                                              const std::vector<tag_ChosenFilter>& vFilters);

// The filters of a search's command line.
class CFilterOptions
{
public:
    // Adds the options to the subcommand; the object must live until the subcommand ran.
    void AddOptions(CLI::App& command);

    // In the order of the table of options, each as often as it was given.
    const std::vector<tag_ChosenFilter>& Chosen() const { return m_vChosen; }
    std::unique_ptr<CFilterChain> MakeChain(CLocalizerLogic& logic) const
    {
        return MakeFilterChain(logic, m_vChosen);
    }

private:
    std::vector<tag_ChosenFilter> m_vChosen;
};

#endif
