#ifndef QV_TOOLS_COMMANDS_H
#define QV_TOOLS_COMMANDS_H

// The subcommands, one source file each. Every function adds its subcommand with its options to
// the application; parsing a command line then runs it. A subcommand that fails throws CToolError.

namespace CLI
{
class App;
}

void AddSampleCommand(CLI::App& app);
void AddImportCommand(CLI::App& app);
void AddIndexCommand(CLI::App& app);
void AddSearchCommand(CLI::App& app);
void AddTypeCommand(CLI::App& app);
void AddShowCommand(CLI::App& app);
void AddNotifyCommand(CLI::App& app);

#endif
