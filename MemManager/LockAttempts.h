#ifndef QV_MEMMANAGER_LOCKATTEMPTS_H
#define QV_MEMMANAGER_LOCKATTEMPTS_H

#include "Common/SystemTime.h"
#include "MemManager/MappingGuards.h"

#include <chrono>

constexpr int STORE_LOCK_ATTEMPTS = 5;
constexpr std::chrono::milliseconds STORE_LOCK_PAUSE(200);
constexpr unsigned int STORE_LOCK_RETRY = 2; // milliseconds

// Pauses, as long as the lock cannot be had: a search holds it for a fraction of the pause, and
// whoever waits for it is not to sleep on when it is free again. True when the lock is held.
inline bool TryDuringPause(CStoreLock* pLock)
{
    using Clock = std::chrono::steady_clock;
    const Clock::time_point end = Clock::now() + STORE_LOCK_PAUSE;
    do
    {
        Sleep(STORE_LOCK_RETRY);
        if (pLock->TryLockQuietly())
        {
            return true;
        }
    } while (Clock::now() < end);
    return false;
}

// Tries a few times to take the store lock. After each refusal it pauses, and calls fnRefused with
// the number of the attempt, counted from 0, when the lock did not become free meanwhile. False
// when it never did.
template <typename FnRefused>
bool TryStoreLock(CStoreLock* pLock, FnRefused fnRefused)
{
    for (int i = 0; i < STORE_LOCK_ATTEMPTS; ++i)
    {
        if (pLock->TryLock() || TryDuringPause(pLock))
        {
            return true;
        }
        fnRefused(i);
    }
    return false;
}

#endif
