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
    explicit CChild(const std::function<std::string()>& fnBody, unsigned int uSeconds);
    // Kills a child whose text was not waited for.
    ~CChild();
    CChild(const CChild&) = delete;
    CChild& operator=(const CChild&) = delete;

    // Waits for the child and returns what its body returned, or how else the child ended.
    std::string Text();

private:
    int m_iPipe = -1;
    pid_t m_iPid;
};

// Memory, zero at first, that this process has in common with children started later.
template <typename T>
class CShared
{
public:
    CShared()
        : m_pMemory(
              mmap(nullptr, sizeof(T), PROT_READ | PROT_WRITE, MAP_SHARED | MAP_ANONYMOUS, -1, 0))
    {
    }
    ~CShared() { munmap(m_pMemory, sizeof(T)); }
    CShared(const CShared&) = delete;
    CShared& operator=(const CShared&) = delete;

    T* operator->() const { return static_cast<T*>(m_pMemory); }
    T& operator*() const { return *static_cast<T*>(m_pMemory); }

private:
    void* m_pMemory;
};

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
