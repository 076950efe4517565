#ifndef QV_TOOLS_PROGRESS_H
#define QV_TOOLS_PROGRESS_H

#include <atomic>
#include <condition_variable>
#include <cstdint>
#include <mutex>
#include <thread>

// A progress bar on standard error, if that is a terminal, for work that takes more than a second.
// The destructor removes it. Write nothing else to the terminal while the object exists.
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
