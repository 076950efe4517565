#include "tools/SearchReport.h"

#include <nlohmann/json.hpp>
#include <ostream>

namespace
{

// Keeps the members in the order of the code.
using Json = nlohmann::ordered_json;

constexpr int INDENT = 2;
// The version of the document's form; rises when a member changes its meaning or is removed.
constexpr int FORM_VERSION = 1;

Json FilterJson(const tag_ChosenFilter& filter)
{
    Json json = {{"filter", filter.strName}};
    if (filter.bHasID)
    {
        json["id"] = filter.iID;
    }
    return json;
}

// Empty for a character without readings.
std::string IndexCharacter(const tag_LocalizerDetail& detail)
{
    return detail.iFirstWord == 0 ? "" : std::string(1, static_cast<char>(detail.iFirstWord));
}

Json ContactJson(const tag_FoundContact& contact, const tag_SearchStep& step)
{
    const tag_LocalizerDetail& detail = contact.detail;
    Json json = {{"contact_id", detail.iContactID},
                 {"name", contact.strName},
                 {"marked", MarkedName(contact, step)},
                 {"name_order", detail.iSortIndex},
                 {"last_time_contacted", detail.llLastTimeContacted}};
    if (step.strTyped.empty())
    {
        json["index_character"] = IndexCharacter(detail);
    }
    else
    {
        json["first_matched"] = FirstMatched(detail);
        json["last_matched"] = LastMatched(detail);
    }
    return json;
}

Json StepJson(const tag_SearchStep& step, const tag_SearchReport& report)
{
    Json matches = Json::array();
    for (const tag_FoundContact& contact : step.vBest)
    {
        matches.push_back(ContactJson(contact, step));
    }
    Json json = {{"typed", step.strTyped},
                 {"total", step.iTotal},
                 {"matches", std::move(matches)},
                 {"mask", step.uMask},
                 {"next_keys", NextKeys(step.uMask, report.IsKeypad())},
                 {"candidates", step.vCandidates}};
    for (const tag_Section& section : step.vSections)
    {
        json["sections"][section.strLabel] = section.iContacts;
    }
    return json;
}

} // namespace

void PrintSearchJson(std::ostream& stream, const tag_SearchReport& report)
{
    Json json = {{"version", FORM_VERSION},  {"type", report.strType},
                 {"input", report.strInput}, {"narrowing", report.bNarrow},
                 {"filters", Json::array()}, {"steps", Json::array()}};
    for (const tag_ChosenFilter& filter : report.vFilters)
    {
        json["filters"].push_back(FilterJson(filter));
    }
    for (const tag_SearchStep& step : report.vSteps)
    {
        json["steps"].push_back(StepJson(step, report));
    }
    // A database may hold names that are no UTF-8, which JSON cannot carry.
    stream << json.dump(INDENT, ' ', false, Json::error_handler_t::replace) << '\n';
}
