#ifndef QV_TOOLS_USAGEERROR_H
#define QV_TOOLS_USAGEERROR_H

#include <string>

namespace CLI
{
class App;
class Error;
} // namespace CLI

// The message for a wrong command line, for CLI::App::failure_message.
std::string UsageError(const CLI::App* pApp, const CLI::Error& error);

#endif
