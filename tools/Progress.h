#ifndef QV_TOOLS_PROGRESS_H
#define QV_TOOLS_PROGRESS_H

#include <atomic>
#include <condition_variable>
#include <cstdint>
#include <mutex>
#include <thread>

// A bar on the terminal that standard error is, for work that takes more than a second; it goes
// with the object. Where standard error is no terminal, nothing is ever shown. Whatever else
// writes to the terminal waits until the object is gone.
class CProgress
{
public:
    explicit CProgress(const char* szDoing);
    ~CProgress();
    CProgress(const CProgress&) = delete;
    CProgress& operator=(const CProgress&) = delete;

    // szDoing is at most 30 characters long and outlives the object.
    void Doing(const char* szDoing) { m_szDoing = szDoing; }
    void Set(uint64_t uDone, uint64_t uTotal);

private:
    void Draw();
    void DrawUntilDone();

    std::atomic<const char*> m_szDoing;
    std::atomic<int> m_iPercent{0};
    std::mutex m_mutex;
    std::condition_variable m_done;
    bool m_bDone = false;
    std::thread m_drawer;
};

#endif
