#include "tests/stress/Process.h"

#include <cerrno>
#include <csignal>
#include <ctime>
#include <stdexcept>
#include <sys/wait.h>
#include <unistd.h>

CProcess::CProcess(const std::vector<std::string>& vArguments) : m_iPid(fork())
{
    if (m_iPid < 0)
    {
        throw std::runtime_error("no process could be started");
    }
    if (m_iPid == 0)
    {
        std::vector<char*> vArgv = {const_cast<char*>("qv_stress")};
        for (const std::string& strArgument : vArguments)
        {
            vArgv.push_back(const_cast<char*>(strArgument.c_str()));
        }
        vArgv.push_back(nullptr);
        execv(QV_STRESS_PROGRAM, vArgv.data());
        _exit(127);
    }
}

CProcess::~CProcess()
{
    if (m_iPid > 0)
    {
        kill(m_iPid, SIGKILL);
        Wait();
    }
}

int CProcess::Wait()
{
    while (m_iPid > 0 && waitpid(m_iPid, &m_iStatus, 0) < 0 && errno == EINTR)
    {
    }
    m_iPid = -1;
    return m_iStatus;
}

bool CProcess::HasEnded()
{
    if (m_iPid > 0 && waitpid(m_iPid, &m_iStatus, WNOHANG) == m_iPid)
    {
        m_iPid = -1;
    }
    return m_iPid < 0;
}

void RequireSuccess(const std::string& strName, int iStatus)
{
    if (WIFSIGNALED(iStatus))
    {
        throw std::runtime_error(strName + " died of signal " + std::to_string(WTERMSIG(iStatus)));
    }
    if (WEXITSTATUS(iStatus) != 0)
    {
        throw std::runtime_error(strName + " ended with " + std::to_string(WEXITSTATUS(iStatus)));
    }
}

void SleepMicroseconds(unsigned int uMicroseconds)
{
    constexpr unsigned int PER_SECOND = 1'000'000;
    timespec time = {static_cast<time_t>(uMicroseconds / PER_SECOND),
                     static_cast<long>(uMicroseconds % PER_SECOND) * 1000L};
    nanosleep(&time, nullptr);
}
