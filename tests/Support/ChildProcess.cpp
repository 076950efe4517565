#include "tests/Support/ChildProcess.h"

#include "Common/DataPaths.h"

#include <csignal>
#include <cstdio>
#include <fcntl.h>
#include <gtest/gtest.h>
#include <stdexcept>
#include <sys/file.h>
#include <sys/wait.h>
#include <unistd.h>

namespace
{

// Forks; each side gets its end of a pipe from the child to this process.
pid_t ForkWithPipe(int* piPipe)
{
    int piEnds[2];
    (void)std::fflush(nullptr);
    const pid_t iPid = pipe(piEnds) == 0 ? fork() : -1;
    if (iPid < 0)
    {
        throw std::runtime_error("no child process");
    }
    *piPipe = piEnds[iPid == 0 ? 1 : 0];
    close(piEnds[iPid == 0 ? 0 : 1]);
    return iPid;
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

void KillChild(pid_t* piPid)
{
    if (*piPid > 0)
    {
        kill(*piPid, SIGKILL);
        waitpid(*piPid, nullptr, 0);
        *piPid = -1;
    }
}

} // namespace

bool RunInChild(const std::function<void()>& fnBody)
{
    const auto fnTell = [&fnBody]
    {
        fnBody();
        (void)std::fflush(nullptr);
        return std::string(testing::Test::HasFailure() ? "failed" : "");
    };
    return CChild(fnTell, 0).Text().empty();
}

CChild::CChild(const std::function<std::string()>& fnBody, unsigned int uSeconds)
    : m_iPid(ForkWithPipe(&m_iPipe))
{
    if (m_iPid == 0)
    {
        alarm(uSeconds);
        const std::string strText = TextOf(fnBody);
        (void)!write(m_iPipe, strText.data(), strText.size());
        _exit(0);
    }
}

CChild::~CChild()
{
    close(m_iPipe);
    KillChild(&m_iPid);
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
    int iStatus = 0;
    waitpid(m_iPid, &iStatus, 0);
    m_iPid = -1;
    if (WIFSIGNALED(iStatus))
    {
        return "ended by signal " + std::to_string(WTERMSIG(iStatus));
    }
    return iStatus == 0 ? strText : "ended with status " + std::to_string(WEXITSTATUS(iStatus));
}

CLockHolder::CLockHolder()
{
    int iPipe = -1;
    m_iPid = ForkWithPipe(&iPipe);
    if (m_iPid == 0)
    {
        // Taken without the code under test, as any other program would.
        const int iFd = open(CDataPaths::LockFile(), O_RDWR | O_CREAT, 0777);
        const char cHeld = flock(iFd, LOCK_EX | LOCK_NB) == 0 ? 1 : 0;
        (void)!write(iPipe, &cHeld, 1);
        for (;;)
        {
            pause();
        }
    }
    char cHeld = 0;
    const bool bTold = read(iPipe, &cHeld, 1) == 1;
    close(iPipe);
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
    KillChild(&m_iPid);
}
