#ifndef QV_TESTS_STRESS_PROCESS_H
#define QV_TESTS_STRESS_PROCESS_H

#include <functional>
#include <string>
#include <sys/types.h>
#include <vector>

// Another process, which runs the body and fails when that throws. No database may be open when
// it starts: SQLite does not outlive a fork.
class CProcess
{
public:
    explicit CProcess(const std::function<void()>& fnBody);
    // Kills a process that was not waited for.
    ~CProcess();
    CProcess(const CProcess&) = delete;
    CProcess& operator=(const CProcess&) = delete;

    // Whether the process was killed by an alarm; false when it succeeded, std::runtime_error
    // with the name when it ended in any other way.
    bool WasKilled(const std::string& strName);

private:
    pid_t m_iPid;
};

// Throws std::runtime_error with the text unless bTrue.
void Require(bool bTrue, const std::string& strText);

void SleepMicroseconds(unsigned long uMicroseconds);

// The main function of a program: runs it with the numbers of its arguments, or those given for
// missing ones, and tells what it threw. The library's log goes nowhere.
int RunProgram(int argc, char** argv, std::vector<int> vNumbers,
               const std::function<void(const std::vector<int>&)>& fnRun);

#endif
