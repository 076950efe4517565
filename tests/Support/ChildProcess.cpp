#include "tests/Support/ChildProcess.h"

#include "Common/DataPaths.h"

#include <csignal>
#include <cstdio>
#include <cstdlib>
#include <fcntl.h>
#include <gtest/gtest.h>
#include <stdexcept>
#include <sys/file.h>
#include <sys/wait.h>
#include <unistd.h>

namespace
{

[[noreturn]] void RunAndLeave(const std::function<void()>& fnBody)
{
    fnBody();
    const bool bFailed = testing::Test::HasFailure();
    (void)std::fflush(nullptr);
    _exit(bFailed ? 1 : 0);
}

std::string TextOf(const std::function<std::string()>& fnBody)
{
    try
    {
        return fnBody();
    }
    catch (const std::exception& error)
    {
        return std::string("threw ") + error.what();
    }
}

int WaitFor(pid_t iPid)
{
    int iStatus = 0;
    if (iPid < 0 || waitpid(iPid, &iStatus, 0) != iPid)
    {
        throw std::runtime_error("no child process");
    }
    return iStatus;
}

} // namespace

bool RunInChild(const std::function<void()>& fnBody)
{
    (void)std::fflush(nullptr);
    const pid_t iPid = fork();
    if (iPid == 0)
    {
        RunAndLeave(fnBody);
    }
    const int iStatus = WaitFor(iPid);
    return WIFEXITED(iStatus) && WEXITSTATUS(iStatus) == 0;
}

int StatusOfChild(const std::function<void()>& fnBody)
{
    (void)std::fflush(nullptr);
    const pid_t iPid = fork();
    if (iPid == 0)
    {
        const int iNull = open("/dev/null", O_WRONLY);
        dup2(iNull, STDOUT_FILENO);
        dup2(iNull, STDERR_FILENO);
        RunAndLeave(fnBody);
    }
    return WaitFor(iPid);
}

CChild::CChild(const std::function<std::string()>& fnBody, unsigned int uSeconds)
{
    int piPipe[2];
    if (pipe(piPipe) != 0)
    {
        throw std::runtime_error("no pipe");
    }
    m_iPid = fork();
    if (m_iPid == 0)
    {
        alarm(uSeconds);
        const std::string strText = TextOf(fnBody);
        (void)!write(piPipe[1], strText.data(), strText.size());
        _exit(0);
    }
    close(piPipe[1]);
    m_iPipe = piPipe[0];
}

CChild::~CChild()
{
    close(m_iPipe);
    if (m_iPid > 0)
    {
        kill(m_iPid, SIGKILL);
        waitpid(m_iPid, nullptr, 0);
    }
}

std::string CChild::Text()
{
    std::string strText;
    char szBuffer[256];
    for (ssize_t iRead = 1; iRead > 0;)
    {
        iRead = read(m_iPipe, szBuffer, sizeof(szBuffer));
        strText.append(szBuffer, static_cast<size_t>(iRead > 0 ? iRead : 0));
    }
    const int iStatus = WaitFor(m_iPid);
    m_iPid = -1;
    if (WIFSIGNALED(iStatus))
    {
        return "ended by signal " + std::to_string(WTERMSIG(iStatus));
    }
    return iStatus == 0 ? strText : "ended with status " + std::to_string(WEXITSTATUS(iStatus));
}

CLockHolder::CLockHolder()
{
    int piPipe[2];
    if (pipe(piPipe) != 0)
    {
        throw std::runtime_error("no pipe");
    }
    m_iPid = fork();
    if (m_iPid == 0)
    {
        // Taken without the code under test, as any other program would.
        const int iFd = open(CDataPaths::LockFile(), O_RDWR | O_CREAT, 0777);
        const char cHeld = flock(iFd, LOCK_EX | LOCK_NB) == 0 ? 1 : 0;
        (void)!write(piPipe[1], &cHeld, 1);
        for (;;)
        {
            pause();
        }
    }
    char cHeld = 0;
    const bool bTold = read(piPipe[0], &cHeld, 1) == 1;
    close(piPipe[0]);
    close(piPipe[1]);
    if (!bTold || cHeld == 0)
    {
        Kill();
        throw std::runtime_error("the second process cannot take the lock");
    }
}

CLockHolder::~CLockHolder()
{
    Kill();
}

void CLockHolder::Kill()
{
    if (m_iPid > 0)
    {
        kill(m_iPid, SIGKILL);
        waitpid(m_iPid, nullptr, 0);
        m_iPid = -1;
    }
}
