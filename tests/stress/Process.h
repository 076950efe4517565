#ifndef QV_TESTS_STRESS_PROCESS_H
#define QV_TESTS_STRESS_PROCESS_H

#include <string>
#include <sys/types.h>
#include <vector>

// Another process of the running program, started anew with its own arguments.
class CProcess
{
public:
    explicit CProcess(const std::vector<std::string>& vArguments);
    // Kills a process that was not waited for.
    ~CProcess();
    CProcess(const CProcess&) = delete;
    CProcess& operator=(const CProcess&) = delete;

    // The status of the ended process, as waitpid tells it.
    int Wait();
    // Whether it ended; waits for nothing.
    bool HasEnded();

private:
    pid_t m_iPid;
    int m_iStatus = 0;
};

// Throws std::runtime_error, with what the status says, unless the process ended with 0.
void RequireSuccess(const std::string& strName, int iStatus);

void SleepMicroseconds(unsigned int uMicroseconds);

#endif
