#ifndef QV_TESTS_SUPPORT_CHILDPROCESS_H
#define QV_TESTS_SUPPORT_CHILDPROCESS_H

#include <functional>
#include <sys/types.h>

// Runs the body in a forked child and waits for it. True when the body came to its end and all
// expectations in it held; what failed is printed by the child.
bool RunInChild(const std::function<void()>& fnBody);

// The same without expectations: the child's status as waitpid tells it; its output is dropped.
int StatusOfChild(const std::function<void()>& fnBody);

// A second process that holds the store lock for as long as the object lives, or until Kill.
class CLockHolder
{
public:
    CLockHolder(); // returns when the lock is held; std::runtime_error when it cannot be
    ~CLockHolder();
    CLockHolder(const CLockHolder&) = delete;
    CLockHolder& operator=(const CLockHolder&) = delete;

    // Kills the process, which leaves the release to the system. Done once.
    void Kill();

private:
    pid_t m_iPid = -1;
};

#endif
