#include "tools/FilterOptions.h"

#include "Core/LocalizerLogic.h"
#include "Filter/Filter.h"
#include "tools/OptionChecks.h"
#include "tools/ToolError.h"

#include <CLI/CLI.hpp>
#include <limits>

namespace
{

// An option and the kind of filter that it stands for.
struct tag_FilterOption
{
    const char* szName;
    int iKind;
    const char* szHelp;
};

constexpr tag_FilterOption ID_OPTIONS[] = {
    {"group", FILTER_GROUP, "Only members of the group (-1: secret contacts)"},
    {"account", FILTER_ACCOUNT, "Only contacts with data in the account"},
    {"not-group", FILTER_GROUP_EXPAND, "No members of the group"},
    {"not-account", FILTER_ACCOUNT_EXPAND, "No contacts confined to the accounts named so"},
    {"not-contact", FILTER_CONTACT_ID_EXPAND, "Not the contact with this id"},
};

constexpr tag_FilterOption PLAIN_OPTIONS[] = {
    {"phone", FILTER_PHONE, "Only contacts with a phone number"},
    {"starred", FILTER_FAVOURITES, "Only favourites"},
    {"mail", FILTER_MAIL, "Only contacts with a mail address"},
    {"postal", FILTER_POSTAL, "Only contacts with a postal address"},
    {"online", FILTER_ONLINE, "Only contacts that are online"},
};

constexpr const char* OPTION_GROUP = "Filters (all must hold; those with an id may be repeated)";

std::string FlagOf(const tag_FilterOption& option)
{
    return std::string("--") + option.szName;
}

} // namespace

void CFilterOptions::AddOptions(CLI::App& command)
{
    for (const tag_FilterOption& option : ID_OPTIONS)
    {
        command
            .add_option_function<std::vector<int>>(
                FlagOf(option),
                [this, &option](const std::vector<int>& vIDs)
                {
                    for (const int iID : vIDs)
                    {
                        m_vChosen.push_back({option.szName, option.iKind, true, iID});
                    }
                },
                option.szHelp)
            ->type_name("ID")
            ->check(WholeNumber(std::numeric_limits<int>::min(), MAX_INT))
            ->allow_extra_args(false)
            ->group(OPTION_GROUP);
    }
    for (const tag_FilterOption& option : PLAIN_OPTIONS)
    {
        command
            .add_flag_callback(
                FlagOf(option),
                [this, &option] {
                    m_vChosen.push_back({option.szName, option.iKind, false, 0});
                },
                option.szHelp)
            ->group(OPTION_GROUP);
    }
}

std::unique_ptr<CFilterChain> MakeFilterChain(CLocalizerLogic& logic,
                                              const std::vector<tag_ChosenFilter>& vFilters)
{
    std::vector<int> vKinds(1); // never empty, since the library requires arrays even for no filter
    std::vector<QVLong32> vIDs(1);
    for (const tag_ChosenFilter& filter : vFilters)
    {
        vKinds.push_back(filter.iKind);
        vIDs.push_back(filter.iID);
    }
    CFilterChain* pChain = nullptr;
    const int iResult = logic.CreateFilterChain(vKinds.data() + 1, vIDs.data() + 1,
                                                static_cast<int>(vFilters.size()), &pChain);
    std::unique_ptr<CFilterChain> chain(pChain);
    if (iResult != 0 || chain == nullptr)
    {
        throw CToolError(TOOL_EXIT_FAILED, "the library could not make the filter chain");
    }
    return chain;
}
