#ifndef QV_MEMMANAGER_LOCKATTEMPTS_H
#define QV_MEMMANAGER_LOCKATTEMPTS_H

#include "Common/SystemTime.h"
#include "MemManager/MappingGuards.h"

constexpr int STORE_LOCK_ATTEMPTS = 5;
constexpr unsigned int STORE_LOCK_PAUSE = 200; // milliseconds

// Tries a few times to take the store lock. After each refusal it pauses and calls fnRefused with
// the number of the attempt, counted from 0. False when all attempts were refused.
template <typename FnRefused>
bool TryStoreLock(CStoreLock* pLock, FnRefused fnRefused)
{
    for (int i = 0; i < STORE_LOCK_ATTEMPTS; ++i)
    {
        if (pLock->TryLock())
        {
            return true;
        }
        Sleep(STORE_LOCK_PAUSE);
        fnRefused(i);
    }
    return false;
}

#endif
