#include "LocalizerImpl/QVLocalizerManager.h"
#include "tools/Commands.h"
#include "tools/ContactNames.h"
#include "tools/DataDirectory.h"
#include "tools/FilterOptions.h"
#include "tools/OptionChecks.h"
#include "tools/SearchReport.h"
#include "tools/SearchSession.h"
#include "tools/ToolError.h"
#include "tools/Utf8Text.h"

#include <CLI/CLI.hpp>
#include <algorithm>
#include <cstdlib>
#include <iostream>
#include <map>
#include <memory>
#include <optional>
#include <unistd.h>

namespace
{

constexpr int DEFAULT_LIMIT = 5;

constexpr const char* JSON_HELP =
    "JSON: {version, type, input, narrowing, filters: [{filter, id}], steps: [{typed, total, "
    "matches,\n"
    "  mask, next_keys, candidates, sections}]}; a match has contact_id, name, marked, "
    "name_order,\n"
    "  last_time_contacted, first_matched and last_matched (indices of characters). For an empty\n"
    "  text it has index_character instead of these two; only then there are sections. version is "
    "1.";

struct tag_SearchOptions
{
    CDataDirectory directory;
    CFilterOptions filters;
    std::string strText;
    std::string strType = "word";
    std::string strColor = "auto";
    std::optional<int> iLimit;
    bool bWhole = false;
    bool bOnce = false;
    bool bJson = false;
    bool bPlain = false;

    // The plain form is for other programs and holds all matches unless a limit is given.
    int Limit() const { return iLimit.value_or(bPlain ? 0 : DEFAULT_LIMIT); }
};

const std::map<std::string, IME_SEARCH_TYPE>& SearchTypes()
{
    static const std::map<std::string, IME_SEARCH_TYPE> mapTypes = {
        {"word", IME_SEARCH_WORD}, {"num", IME_SEARCH_NUM}, {"special", IME_SEARCH_SPECIAL}};
    return mapTypes;
}

std::wstring TypedText(const std::string& strText)
{
    bool bWhole = true;
    std::wstring wstrText = WideText(strText, &bWhole);
    if (!bWhole)
    {
        throw CToolError(TOOL_EXIT_USAGE,
                         "the text is not UTF-8, or holds a character beyond U+FFFF");
    }
    if (wstrText.size() > LOC_MAX_INPUT)
    {
        throw CToolError(TOOL_EXIT_USAGE,
                         "the text has " + std::to_string(wstrText.size()) +
                             " characters; a search takes at most " + std::to_string(LOC_MAX_INPUT),
                         "Type less: the beginning of a name is enough.");
    }
    return wstrText;
}

void RequireFiles(const tag_SearchOptions& options, IME_SEARCH_TYPE eType)
{
    if (eType != IME_SEARCH_SPECIAL)
    {
        options.directory.RequireDatabase();
    }
    options.directory.RequireIndex();
}

// The length of the text of the first search; each further search has one key more.
size_t FirstLength(const tag_SearchOptions& options, const std::wstring& wstrText)
{
    return options.bOnce || wstrText.empty() ? wstrText.size() : 1;
}

std::vector<tag_SearchStep> TypeKeyByKey(const tag_SearchOptions& options, IME_SEARCH_TYPE eType,
                                         const std::wstring& wstrText)
{
    CLocalizerLogic logic;
    const std::unique_ptr<CFilterChain> chain = options.filters.MakeChain(logic);
    CSearchSession session(eType, *chain, !options.bWhole,
                           eType == IME_SEARCH_SPECIAL ? LookUpByCodes() : LookUpInDatabase());
    std::vector<tag_SearchStep> vSteps;
    for (size_t n = FirstLength(options, wstrText); n <= wstrText.size(); ++n)
    {
        vSteps.push_back(session.Search(wstrText.substr(0, n), options.Limit()));
    }
    return vSteps;
}

bool IsDigit(wchar_t unit)
{
    return unit >= L'0' && unit <= L'9';
}

// Prints a hint if the text looks as if it was meant for the other kind of search.
void PrintHint(IME_SEARCH_TYPE eType, const std::wstring& wstrText)
{
    if (eType != IME_SEARCH_NUM && std::any_of(wstrText.begin(), wstrText.end(), IsDigit))
    {
        std::cerr << "Hint: a digit stands for itself here; for the keys of a keypad add "
                     "--type num.\n";
    }
    if (eType == IME_SEARCH_NUM && !std::all_of(wstrText.begin(), wstrText.end(), IsDigit))
    {
        std::cerr << "Hint: a keypad search finds digits only; for letters and characters leave "
                     "--type num out.\n";
    }
}

std::string Variable(const char* szName)
{
    const char* szValue = std::getenv(szName);
    return szValue == nullptr ? "" : szValue;
}

bool UsesColor(const std::string& strColor)
{
    if (strColor != "auto")
    {
        return strColor == "always";
    }
    const std::string strTerminal = Variable("TERM");
    return isatty(STDOUT_FILENO) != 0 && Variable("NO_COLOR").empty() && !strTerminal.empty() &&
           strTerminal != "dumb";
}

void Print(const tag_SearchOptions& options, const tag_SearchReport& report)
{
    if (options.bJson)
    {
        PrintSearchJson(std::cout, report);
    }
    else if (options.bPlain)
    {
        PrintSearchPlain(std::cout, report);
    }
    else
    {
        PrintSearchText(std::cout, report, UsesColor(options.strColor));
    }
}

void RunSearch(const tag_SearchOptions& options)
{
    options.directory.Use();
    const std::wstring wstrText = TypedText(options.strText);
    const IME_SEARCH_TYPE eType = SearchTypes().at(options.strType);
    RequireFiles(options, eType);

    tag_SearchReport report;
    report.strType = options.strType;
    report.strInput = options.strText;
    report.bNarrow = !options.bWhole;
    report.vFilters = options.filters.Chosen();
    report.vSteps = TypeKeyByKey(options, eType, wstrText);
    if (!options.bJson)
    {
        PrintHint(eType, wstrText);
    }
    Print(options, report);
}

void AddFormOptions(CLI::App& command, tag_SearchOptions& options)
{
    CLI::Option* pJson =
        command.add_flag("--json", options.bJson, "Print one JSON document for programs");
    command
        .add_flag("--plain", options.bPlain,
                  "Print the matches of the whole text for pipes: id, tab, name")
        ->excludes(pJson);
    command
        .add_option("--color", options.strColor,
                    "Show what matched in colour instead of brackets; auto: on a terminal, "
                    "unless NO_COLOR is set")
        ->check(CLI::IsMember({"auto", "always", "never"}))
        ->capture_default_str();
}

void AddSearchOptions(CLI::App& command, tag_SearchOptions& options)
{
    command
        .add_option("text", options.strText,
                    "What is typed, at most 10 characters: letters, keypad digits, Chinese "
                    "characters, # for any digit or sign; \"\" lists everybody")
        ->required();
    command
        .add_option("--type", options.strType,
                    "word: letters; num: keypad digits; special: letters over the special "
                    "numbers, without filters")
        ->check(CLI::IsMember({"word", "num", "special"}))
        ->capture_default_str();
    command.add_flag("--whole", options.bWhole,
                     "Search the whole index after each key instead of the matches before it");
    command.add_flag("--once", options.bOnce, "Search once for the whole text, not key by key");
    command
        .add_option("--limit", options.iLimit,
                    "Matches to show after each key, 0 for all (default: " +
                        std::to_string(DEFAULT_LIMIT) + ", all with --plain)")
        ->type_name("N")
        ->check(WholeNumber(0, MAX_INT));
    AddFormOptions(command, options);
}

} // namespace

void AddSearchCommand(CLI::App& app)
{
    auto pOptions = std::make_shared<tag_SearchOptions>();
    CLI::App* pCommand =
        app.add_subcommand("search", "Type a text key by key and show the matches");
    pOptions->directory.AddOption(*pCommand);
    AddSearchOptions(*pCommand, *pOptions);
    pOptions->filters.AddOptions(*pCommand);
    pCommand->footer(std::string(JSON_HELP) + "\n\n" + app.get_footer());
    pCommand->callback([pOptions] { RunSearch(*pOptions); });
}
