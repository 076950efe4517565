#ifndef QV_TESTS_SUPPORT_CHILDPROCESS_H
#define QV_TESTS_SUPPORT_CHILDPROCESS_H

#include <functional>
#include <string>
#include <sys/mman.h>
#include <sys/types.h>

// Runs the body in a forked child and waits for it. True when the body came to its end and all
// expectations in it held; what failed is printed by the child.
bool RunInChild(const std::function<void()>& fnBody);

// A forked child that runs the body. No database may be open when it starts: SQLite does not
// outlive a fork.
class CChild
{
public:
    // An alarm ends a child that hangs for so many seconds; 0: it may hang.
    CChild(const std::function<std::string()>& fnBody, unsigned int uSeconds);
    // Kills a child whose text was not waited for.
    ~CChild();
    CChild(const CChild&) = delete;
    CChild& operator=(const CChild&) = delete;

    // Waits for the child and returns what its body returned, or how else the child ended.
    std::string Text();

private:
    int m_iPipe = -1;
    pid_t m_iPid = -1;
};

// Memory, zero at first, that this process has in common with children started later. It is never
// released.
template <typename T>
T& NewShared()
{
    constexpr int FLAGS = MAP_SHARED | MAP_ANONYMOUS;
    return *static_cast<T*>(mmap(nullptr, sizeof(T), PROT_READ | PROT_WRITE, FLAGS, -1, 0));
}

// Holds the store lock until Release, if nobody else does: taken without the code under test, as
// any other program would. An open file of its own excludes this process, too.
class CLockHolder
{
public:
    CLockHolder();
    ~CLockHolder() { Release(); }
    CLockHolder(const CLockHolder&) = delete;
    CLockHolder& operator=(const CLockHolder&) = delete;

    bool IsHeld() const { return m_bHeld; }
    void Release();

private:
    int m_iFd;
    bool m_bHeld;
};

// How many descriptors this process has.
std::ptrdiff_t OpenDescriptors();

#endif
