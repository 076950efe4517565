#include "tools/LibraryLog.h"

#include "Common/DataPaths.h"
#include "Common/Log.h"
#include "Platform/LogSink.h"

#include <algorithm>
#include <cstdlib>
#include <filesystem>
#include <system_error>
#include <unistd.h>
#include <utility>

namespace fs = std::filesystem;

namespace
{

constexpr const char* PHASE_BEGIN = "QV_Contacts: ";
constexpr const char* PHASE_TIME = " time = ";
constexpr const char* BLANKS = " \n";

void Drop(void* /*pContext*/, int /*iPriority*/, const char* /*szTag*/, const char* /*szText*/) {}

bool IsPhaseLine(const std::string& strLine)
{
    return strLine.find(PHASE_TIME) != std::string::npos;
}

std::string Trimmed(const std::string& strLine)
{
    const size_t uFirst = strLine.find_first_not_of(BLANKS);
    return uFirst == std::string::npos
               ? ""
               : strLine.substr(uFirst, strLine.find_last_not_of(BLANKS) + 1 - uFirst);
}

// Whether the lock file cannot be used, rather than being locked by another process.
bool IsLockBroken()
{
    const char* szPath = CDataPaths::LockFile();
    std::error_code error;
    return fs::exists(szPath, error) &&
           (!fs::is_regular_file(szPath, error) || access(szPath, R_OK | W_OK) != 0);
}

// The reason that a part of a line stands for.
struct tag_Reason
{
    const char* szPart;
    const char* szReason; // null: the lock's
};

constexpr tag_Reason REASONS[] = {
    {"lock false", nullptr},
    {"Lock share mem false", nullptr},
    {"SQLITE_BUSY", "another process holds the database"},
    {"damaged registration record", "the index is damaged"},
};

} // namespace

void SilenceLibraryLog()
{
    CLogSink::Set(&Drop, nullptr);
}

CLibraryLog::CLibraryLog(std::function<void()> fnPhase) : m_fnPhase(std::move(fnPhase))
{
    CLogSink::Set(&CLibraryLog::Collect, this);
}

CLibraryLog::~CLibraryLog()
{
    SilenceLibraryLog();
}

int CLibraryLog::PhaseTime(const char* szPhase) const
{
    const std::string strBegin = std::string(PHASE_BEGIN) + szPhase + PHASE_TIME;
    int iTime = -1;
    for (const std::string& strLine : m_vPhases)
    {
        if (strLine.compare(0, strBegin.size(), strBegin) == 0)
        {
            iTime = std::atoi(strLine.c_str() + strBegin.size());
        }
    }
    return iTime;
}

std::string CLibraryLog::LockReason()
{
    return IsLockBroken() ? std::string("the lock file cannot be opened: ") + CDataPaths::LockFile()
                          : "another process holds the store";
}

std::string CLibraryLog::WithReason(const std::string& strWhat) const
{
    for (const std::string& strLine : m_vErrors)
    {
        for (const tag_Reason& reason : REASONS)
        {
            if (strLine.find(reason.szPart) != std::string::npos)
            {
                return strWhat + ": " +
                       (reason.szReason == nullptr ? LockReason() : reason.szReason);
            }
        }
    }
    return strWhat;
}

void CLibraryLog::Collect(void* pContext, int iPriority, const char* /*szTag*/, const char* szText)
{
    CLibraryLog& log = *static_cast<CLibraryLog*>(pContext);
    const std::string strLine = Trimmed(szText);
    if (iPriority >= QV_LOG_ERROR)
    {
        std::vector<std::string>& vErrors = log.m_vErrors;
        if (std::find(vErrors.begin(), vErrors.end(), strLine) == vErrors.end())
        {
            vErrors.push_back(strLine);
        }
    }
    else if (IsPhaseLine(strLine))
    {
        log.m_vPhases.push_back(strLine);
        if (log.m_fnPhase)
        {
            log.m_fnPhase();
        }
    }
}
