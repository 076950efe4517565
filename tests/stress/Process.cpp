#include "tests/stress/Process.h"

#include "Platform/LogSink.h"

#include <chrono>
#include <csignal>
#include <iostream>
#include <stdexcept>
#include <sys/wait.h>
#include <thread>
#include <unistd.h>

namespace
{

int RunGuarded(const std::function<void()>& fnRun)
{
    try
    {
        fnRun();
        return 0;
    }
    catch (const std::exception& error)
    {
        std::cerr << error.what() << std::endl;
        return 1;
    }
}

void Silence(void* /*pContext*/, int /*iPriority*/, const char* /*szTag*/, const char* /*szText*/)
{
}

} // namespace

CProcess::CProcess(const std::function<void()>& fnBody) : m_iPid(fork())
{
    Require(m_iPid >= 0, "no process could be started");
    if (m_iPid == 0)
    {
        _exit(RunGuarded(fnBody));
    }
}

CProcess::~CProcess()
{
    if (m_iPid > 0)
    {
        kill(m_iPid, SIGKILL);
        waitpid(m_iPid, nullptr, 0);
    }
}

bool CProcess::WasKilled(const std::string& strName)
{
    int iStatus = 0;
    waitpid(m_iPid, &iStatus, 0);
    m_iPid = -1;
    const bool bKilled = WIFSIGNALED(iStatus) && WTERMSIG(iStatus) == SIGALRM;
    Require(bKilled || iStatus == 0, strName + " ended with status " + std::to_string(iStatus));
    return bKilled;
}

void Require(bool bTrue, const std::string& strText)
{
    if (!bTrue)
    {
        throw std::runtime_error(strText);
    }
}

void SleepMicroseconds(unsigned long uMicroseconds)
{
    std::this_thread::sleep_for(std::chrono::microseconds(uMicroseconds));
}

int RunProgram(int argc, char** argv, std::vector<int> vNumbers,
               const std::function<void(const std::vector<int>&)>& fnRun)
{
    const auto start = std::chrono::steady_clock::now();
    CLogSink::Set(&Silence, nullptr);
    const int iResult = RunGuarded(
        [&]
        {
            for (size_t i = 1; i < static_cast<size_t>(argc) && i <= vNumbers.size(); ++i)
            {
                vNumbers[i - 1] = std::stoi(argv[i]);
            }
            fnRun(vNumbers);
        });
    const std::chrono::duration<double> time = std::chrono::steady_clock::now() - start;
    std::cout << "Done in " << static_cast<int>(time.count()) << " s" << std::endl;
    return iResult;
}
