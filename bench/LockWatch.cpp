#include "bench/LockWatch.h"

#include "Platform/LogSink.h"

#include <algorithm>
#include <cstring>

namespace
{

bool Begins(const char* szText, const char* szBeginning)
{
    return std::strncmp(szText, szBeginning, std::strlen(szBeginning)) == 0;
}

} // namespace

CLockWatch::CLockWatch()
{
    CLogSink::Set(&CLockWatch::AtLine, this);
}

CLockWatch::~CLockWatch()
{
    CLogSink::Set(nullptr, nullptr);
}

// An attempt that waits writes no line when it succeeds: the first line behind it does for that.
void CLockWatch::AtLine(void* pContext, int /*iPriority*/, const char* /*szTag*/,
                        const char* szText)
{
    auto* pWatch = static_cast<CLockWatch*>(pContext);
    if (Begins(szText, "QV_Contacts:Lock TRY LOCK"))
    {
        pWatch->Asked();
    }
    else if (Begins(szText, "QV_Contacts:LOCK RET = 1") ||
             Begins(szText, "QV_Contacts:CopyContactsResult iContactCount"))
    {
        pWatch->Taken();
    }
    else if (Begins(szText, "QV_Contacts:UNLOCK RET"))
    {
        pWatch->Released();
    }
}

void CLockWatch::Asked()
{
    m_asked = Clock::now();
}

void CLockWatch::Taken()
{
    if (!m_bHeld)
    {
        m_bHeld = true;
        m_taken = Clock::now();
        const double dWait = std::chrono::duration<double>(m_taken - m_asked).count();
        m_dLongestWait = std::max(m_dLongestWait, dWait);
    }
}

void CLockWatch::Released()
{
    m_bHeld = false;
    m_dHeld = std::chrono::duration<double>(Clock::now() - m_taken).count();
    m_dLongestHeld = std::max(m_dLongestHeld, m_dHeld);
}
