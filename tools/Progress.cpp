#include "tools/Progress.h"

#include <algorithm>
#include <chrono>
#include <cstdio>
#include <string>
#include <unistd.h>

namespace
{

constexpr std::chrono::milliseconds SILENCE{1000};
constexpr std::chrono::milliseconds BETWEEN_DRAWINGS{100};
constexpr int BAR_WIDTH = 30;
constexpr int LINE_WIDTH = 30 + BAR_WIDTH + 8; // text, bar, brackets and percent

} // namespace

CProgress::CProgress(const char* szDoing) : m_szDoing(szDoing)
{
    if (isatty(STDERR_FILENO) != 0)
    {
        m_drawer = std::thread([this] { DrawUntilDone(); });
    }
}

CProgress::~CProgress()
{
    if (m_drawer.joinable())
    {
        {
            const std::lock_guard<std::mutex> lock(m_mutex);
            m_bDone = true;
        }
        m_done.notify_one();
        m_drawer.join();
    }
}

void CProgress::Set(uint64_t uDone, uint64_t uTotal)
{
    const uint64_t uPercent = uTotal == 0 ? 0 : std::min(uDone, uTotal) * 100 / uTotal;
    m_iPercent = static_cast<int>(uPercent);
}

void CProgress::Draw()
{
    const int iPercent = m_iPercent;
    const int iFilled = iPercent * BAR_WIDTH / 100;
    const std::string strBar = std::string(static_cast<size_t>(iFilled), '#') +
                               std::string(static_cast<size_t>(BAR_WIDTH - iFilled), '.');
    std::fprintf(stderr, "\r%-30s [%s] %3d%%", m_szDoing.load(), strBar.c_str(), iPercent);
    std::fflush(stderr);
}

void CProgress::DrawUntilDone()
{
    std::unique_lock<std::mutex> lock(m_mutex);
    const auto IsDone = [this] { return m_bDone; };
    if (m_done.wait_for(lock, SILENCE, IsDone))
    {
        return;
    }
    do
    {
        Draw();
    } while (!m_done.wait_for(lock, BETWEEN_DRAWINGS, IsDone));
    std::fprintf(stderr, "\r%*s\r", LINE_WIDTH, "");
    std::fflush(stderr);
}
