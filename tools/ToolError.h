#ifndef QV_TOOLS_TOOLERROR_H
#define QV_TOOLS_TOOLERROR_H

#include <stdexcept>
#include <string>
#include <utility>
#include <vector>

// The exit status of the tool.
enum TOOL_EXIT : int
{
    TOOL_EXIT_DONE = 0,    // also for a search without matches
    TOOL_EXIT_FAILED = 1,  // the library, SQLite or the system could not do it
    TOOL_EXIT_USAGE = 2,   // the command line is wrong
    TOOL_EXIT_MISSING = 3, // a file that another subcommand makes, or a package, is missing
    TOOL_EXIT_PARTLY = 4,  // something in an imported file was refused, the rest taken
};

// Advice if the files of the index are damaged.
constexpr const char* BUILD_ANEW = "Build the index anew with the subcommand index.";

// Ends a subcommand: what is wrong, what to do about it (may be empty), and log lines with details.
// Control characters in them are escaped when the error is shown.
class CToolError : public std::runtime_error
{
public:
    CToolError(TOOL_EXIT eExit, const std::string& strWhat, std::string strAdvice = "",
               std::vector<std::string> vDetails = {})
        : std::runtime_error(strWhat), m_eExit(eExit), m_strAdvice(std::move(strAdvice)),
          m_vDetails(std::move(vDetails))
    {
    }

    TOOL_EXIT Exit() const { return m_eExit; }
    const std::string& Advice() const { return m_strAdvice; }
    const std::vector<std::string>& Details() const { return m_vDetails; }

private:
    TOOL_EXIT m_eExit;
    std::string m_strAdvice;
    std::vector<std::string> m_vDetails;
};

#endif
