#ifndef QV_TOOLS_LIBRARYLOG_H
#define QV_TOOLS_LIBRARYLOG_H

#include <functional>
#include <string>
#include <vector>

// Drops the lines of the library's log: a subcommand collects the lines that it needs and reports
// failures in its own words.
void SilenceLibraryLog();

// Collects the library's log for as long as the object lives; one object at a time.
class CLibraryLog
{
public:
    // fnPhase, if given, is called at the end of each phase of a build.
    explicit CLibraryLog(std::function<void()> fnPhase = nullptr);
    ~CLibraryLog();
    CLibraryLog(const CLibraryLog&) = delete;
    CLibraryLog& operator=(const CLibraryLog&) = delete;

    // The milliseconds of the last line "QV_Contacts: <szPhase> time = <n>", -1 without one.
    int PhaseTime(const char* szPhase) const;
    // The lines of error priority, each once.
    const std::vector<std::string>& Errors() const { return m_vErrors; }
    // Why the store's lock was refused.
    static std::string LockReason();
    // strWhat with the reason that the errors contain, if it is one of the usual ones.
    std::string WithReason(const std::string& strWhat) const;

private:
    static void Collect(void* pContext, int iPriority, const char* szTag, const char* szText);

    std::function<void()> m_fnPhase;
    std::vector<std::string> m_vPhases;
    std::vector<std::string> m_vErrors;
};

#endif
