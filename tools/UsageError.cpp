#include "tools/UsageError.h"

#include "tools/PrintableText.h"

#include <CLI/CLI.hpp>
#include <vector>

namespace
{

std::string SubcommandNames(const CLI::App& app)
{
    std::string strNames;
    for (const CLI::App* pCommand : app.get_subcommands(nullptr))
    {
        strNames += (strNames.empty() ? "" : ", ") + pCommand->get_name();
    }
    return strNames;
}

// The word in the place of a subcommand or of the options of app; empty if there is none. The
// parser only reports that a subcommand is missing.
std::string Unexpected(const CLI::App& app)
{
    const std::vector<std::string> vRest = app.remaining();
    const std::vector<CLI::App*> vNamed = app.get_subcommands();
    if (!vRest.empty() && vRest.front()[0] == '-')
    {
        return vRest.front() + " is not an option of " + app.get_name() +
               (app.get_parent() == nullptr ? "; options follow the subcommand" : "");
    }
    if (!vNamed.empty())
    {
        return Unexpected(*vNamed.back());
    }
    const std::string strNames = SubcommandNames(app);
    return strNames.empty() || vRest.empty()
               ? ""
               : "unknown subcommand \"" + vRest.front() + "\"; there are " + strNames;
}

} // namespace

std::string UsageError(const CLI::App* pApp, const CLI::Error& error)
{
    const std::string strUnexpected = Unexpected(*pApp);
    return "qvlocalize: " + PrintableText(strUnexpected.empty() ? error.what() : strUnexpected) +
           "\nRun with --help for more information.\n";
}
