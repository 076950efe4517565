#ifndef QV_BENCH_LOCKWATCH_H
#define QV_BENCH_LOCKWATCH_H

#include <chrono>

// How long this process waits for the store lock and holds it, told by the library's log lines.
// One object at a time.
class CLockWatch
{
public:
    CLockWatch();
    ~CLockWatch();
    CLockWatch(const CLockWatch&) = delete;
    CLockWatch& operator=(const CLockWatch&) = delete;

    // Seconds: of the last lock, and the longest so far.
    double Held() const { return m_dHeld; }
    double LongestHeld() const { return m_dLongestHeld; }
    double LongestWait() const { return m_dLongestWait; }

private:
    using Clock = std::chrono::steady_clock;

    static void AtLine(void* pContext, int iPriority, const char* szTag, const char* szText);
    void Asked();
    void Taken();
    void Released();

    Clock::time_point m_asked;
    Clock::time_point m_taken;
    bool m_bHeld = false;
    double m_dHeld = 0;
    double m_dLongestHeld = 0;
    double m_dLongestWait = 0;
};

#endif
