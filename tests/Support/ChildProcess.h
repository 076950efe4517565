#ifndef QV_TESTS_SUPPORT_CHILDPROCESS_H
#define QV_TESTS_SUPPORT_CHILDPROCESS_H

#include "MemManager/Files/Descriptor.h"

#include <cstddef>
#include <functional>
#include <sys/types.h>

// A forked child that runs the body. No database may be open when it starts: SQLite does not
// outlive a fork.
class CChild
{
public:
    // An alarm ends a child that hangs for so many seconds; 0: it may hang.
    explicit CChild(const std::function<void()>& fnBody, unsigned int uSeconds = 0);
    // Kills a child that was not waited for.
    ~CChild();
    CChild(const CChild&) = delete;
    CChild& operator=(const CChild&) = delete;

    // Waits for the child. True when the body came to its end and all expectations in it held;
    // what failed is printed by the child.
    bool Passes();

private:
    pid_t m_iPid = -1;
};

// Holds the store lock until Release, if nobody else does: taken without the code under test, as
// any other program would. An open file of its own excludes this process, too.
class CLockHolder
{
public:
    CLockHolder();

    bool IsHeld() const { return m_bHeld; }
    void Release() { m_file.Reset(); }

private:
    CDescriptor m_file;
    bool m_bHeld;
};

// How many descriptors this process has.
std::ptrdiff_t OpenDescriptors();

#endif
