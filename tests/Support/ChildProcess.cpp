#include "tests/Support/ChildProcess.h"

#include "Common/DataPaths.h"

#include <csignal>
#include <cstdio>
#include <cstdlib>
#include <fcntl.h>
#include <filesystem>
#include <gtest/gtest.h>
#include <stdexcept>
#include <sys/file.h>
#include <sys/wait.h>
#include <unistd.h>

namespace
{

// What the body throws ends the child by a signal.
[[noreturn]] void RunAndExit(const std::function<std::string()>& fnBody, int iPipe) noexcept
{
    const std::string strText = fnBody();
    (void)!write(iPipe, strText.data(), strText.size());
    std::exit(0); // not _exit: a coverage build writes its counters
}

} // namespace

bool RunInChild(const std::function<void()>& fnBody)
{
    const auto fnTell = [&fnBody]
    {
        fnBody();
        return std::string(testing::Test::HasFailure() ? "failed" : "");
    };
    return CChild(fnTell, 0).Text().empty();
}

CChild::CChild(const std::function<std::string()>& fnBody, unsigned int uSeconds)
{
    int piEnds[2];
    (void)std::fflush(nullptr);
    m_iPid = pipe(piEnds) == 0 ? fork() : -1;
    if (m_iPid < 0)
    {
        throw std::runtime_error("no child process");
    }
    m_iPipe = piEnds[m_iPid == 0 ? 1 : 0];
    close(piEnds[m_iPid == 0 ? 0 : 1]);
    if (m_iPid == 0)
    {
        alarm(uSeconds);
        RunAndExit(fnBody, m_iPipe);
    }
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
    for (char cRead = 0; read(m_iPipe, &cRead, 1) == 1;)
    {
        strText += cRead;
    }
    int iStatus = 0;
    waitpid(m_iPid, &iStatus, 0);
    m_iPid = -1;
    return iStatus == 0 ? strText : "ended with status " + std::to_string(iStatus);
}

CLockHolder::CLockHolder()
    : m_file(open(CDataPaths::LockFile(), O_RDWR | O_CREAT, 0777)),
      m_bHeld(flock(m_file.Get(), LOCK_EX | LOCK_NB) == 0)
{
}

std::ptrdiff_t OpenDescriptors()
{
    return std::distance(std::filesystem::directory_iterator("/proc/self/fd"),
                         std::filesystem::directory_iterator());
}
