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

CChild::CChild(const std::function<void()>& fnBody, unsigned int uSeconds)
{
    (void)std::fflush(nullptr);
    m_iPid = fork();
    if (m_iPid < 0)
    {
        throw std::runtime_error("no child process");
    }
    if (m_iPid == 0)
    {
        alarm(uSeconds);
        [&fnBody]() noexcept { fnBody(); }();           // what it throws ends the child by a signal
        std::exit(testing::Test::HasFailure() ? 1 : 0); // a coverage build writes its counters
    }
}

CChild::~CChild()
{
    if (m_iPid > 0)
    {
        kill(m_iPid, SIGKILL);
        waitpid(m_iPid, nullptr, 0);
    }
}

bool CChild::Passes()
{
    int iStatus = -1; // also where there is no child to wait for
    waitpid(m_iPid, &iStatus, 0);
    m_iPid = -1;
    return iStatus == 0;
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
