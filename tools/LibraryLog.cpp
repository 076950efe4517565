#include "tools/LibraryLog.h"

#include "Common/Log.h"
#include "Platform/LogSink.h"

#include <cstdlib>

namespace
{

constexpr const char* PHASE_BEGIN = "QV_Contacts: ";
constexpr const char* PHASE_TIME = " time = ";

void Drop(void* /*pContext*/, int /*iPriority*/, const char* /*szTag*/, const char* /*szText*/) {}

bool IsPhaseLine(const std::string& strLine)
{
    return strLine.find(PHASE_TIME) != std::string::npos;
}

std::string WithoutLineEnd(std::string strLine)
{
    while (!strLine.empty() && (strLine.back() == '\n' || strLine.back() == ' '))
    {
        strLine.pop_back();
    }
    return strLine;
}

} // namespace

void SilenceLibraryLog()
{
    CLogSink::Set(&Drop, nullptr);
}

CLibraryLog::CLibraryLog()
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

void CLibraryLog::Collect(void* pContext, int iPriority, const char* /*szTag*/, const char* szText)
{
    CLibraryLog& log = *static_cast<CLibraryLog*>(pContext);
    const std::string strLine = WithoutLineEnd(szText);
    if (iPriority >= QV_LOG_ERROR)
    {
        log.m_vErrors.push_back(strLine);
    }
    else if (IsPhaseLine(strLine))
    {
        log.m_vPhases.push_back(strLine);
    }
}
