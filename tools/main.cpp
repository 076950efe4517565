#include "tools/Commands.h"
#include "tools/LibraryLog.h"
#include "tools/PrintableText.h"
#include "tools/ToolError.h"
#include "tools/UsageError.h"

#include <CLI/CLI.hpp>
#include <cstdlib>
#include <exception>
#include <fcntl.h>
#include <iostream>
#include <string>
#include <unistd.h>

namespace
{

constexpr const char* EXIT_CODES = "Exit codes: 0 done (also a search without matches), "
                                   "1 the library or the system failed,\n"
                                   "2 wrong use of the command line, 3 no database, pinyin table "
                                   "or index there,\n"
                                   "or no file or package to import with, 4 imported except for "
                                   "what was refused.";

void AddCommands(CLI::App& app)
{
    app.require_subcommand(1);
    app.footer(EXIT_CODES); // subcommands added later inherit it
    AddSampleCommand(app);
    AddImportCommand(app);
    AddIndexCommand(app);
    AddSearchCommand(app);
    AddTypeCommand(app);
    AddShowCommand(app);
    AddNotifyCommand(app);
}

int Report(const CToolError& error)
{
    std::cerr << "qvlocalize: " << PrintableText(error.what()) << '\n';
    for (const std::string& strDetail : error.Details())
    {
        std::cerr << "  " << PrintableText(strDetail) << '\n';
    }
    if (!error.Advice().empty())
    {
        std::cerr << PrintableText(error.Advice()) << '\n';
    }
    return error.Exit();
}

TOOL_EXIT Parse(CLI::App& app, int argc, char** argv)
{
    try
    {
        app.parse(argc, argv);
    }
    catch (const CLI::ParseError& error)
    {
        return app.exit(error) == 0 ? TOOL_EXIT_DONE : TOOL_EXIT_USAGE;
    }
    return TOOL_EXIT_DONE;
}

int RunCommandLine(CLI::App& app, int argc, char** argv)
{
    const TOOL_EXIT eExit = Parse(app, argc, argv);
    std::cout.flush();
    if (!std::cout)
    {
        throw CToolError(TOOL_EXIT_FAILED, "the output could not be written");
    }
    return eExit;
}

// If the caller closed a standard stream, the next file that is opened would get its descriptor,
// and the output would go into that file. Occupies such descriptors so that reading and writing
// fail.
void TakeClosedStreams()
{
    for (const int iFd : {STDIN_FILENO, STDOUT_FILENO, STDERR_FILENO})
    {
        if (fcntl(iFd, F_GETFD) == -1 &&
            open("/dev/null", iFd == STDIN_FILENO ? O_WRONLY : O_RDONLY) != iFd)
        {
            std::_Exit(TOOL_EXIT_FAILED);
        }
    }
}

} // namespace

int main(int argc, char** argv)
{
    try
    {
        TakeClosedStreams();
        SilenceLibraryLog();
        CLI::App app("Builds, shows and searches the contact index of a provider's data "
                     "directory.",
                     "qvlocalize");
        app.set_version_flag("--version", "qvlocalize " QV_TOOL_VERSION, "Tells the version");
        app.failure_message(&UsageError); // inherited by the subcommands
        AddCommands(app);
        return RunCommandLine(app, argc, argv);
    }
    catch (const CToolError& error)
    {
        return Report(error);
    }
    catch (const std::exception& error)
    {
        return Report(CToolError(TOOL_EXIT_FAILED, error.what()));
    }
}
