#ifndef QV_MEMMANAGER_FILES_STORELOCK_H
#define QV_MEMMANAGER_FILES_STORELOCK_H

#include "Common/Log.h"
#include "Common/SystemTime.h"
#include "MemManager/Files/Descriptor.h"
#include "MemManager/Files/SingleMutex.h"

#include <chrono>

// The store lock with a holder of its own (see CSingleMutex).
class CStoreLock
{
public:
    CStoreLock() = default;
    ~CStoreLock() { Release(); }
    CStoreLock(const CStoreLock&) = delete;
    CStoreLock& operator=(const CStoreLock&) = delete;

    // One attempt, without waiting; call only while this object does not hold the lock. The quiet
    // one writes no log line.
    LOCK_RESULT TryLock() { return CSingleMutex::TryLock(&m_iFd); }
    LOCK_RESULT TryLockQuietly() { return CSingleMutex::TryLockQuietly(&m_iFd); }
    bool IsHeld() const { return m_iFd != 0; }
    // Releases the lock if it is held.
    void Release()
    {
        if (IsHeld())
        {
            CSingleMutex::UnLock(&m_iFd);
            m_iFd = 0;
        }
    }

private:
    int m_iFd = 0;
};

// A writer of the store takes this lock after the store lock and keeps it longer: until its records
// are on the disk and its mark is lifted. Searches take the store lock alone, so they do not wait
// for the disk. It is an advisory lock on the directory of the store files; like the store lock it
// excludes every other holder, and the system releases it when its process dies.
class CWriterLock
{
public:
    CWriterLock() = default;
    ~CWriterLock() { Release(); }
    CWriterLock(const CWriterLock&) = delete;
    CWriterLock& operator=(const CWriterLock&) = delete;

    // Call with the store lock held. Waits for a writer that has released the store lock but not
    // yet this one. False if the directory cannot be opened or locked.
    bool Take();
    // Releases the lock if it is held, also where a forked child still has the descriptor.
    void Release();

private:
    CDescriptor m_directory;
};

constexpr int STORE_LOCK_ATTEMPTS = 5;
constexpr std::chrono::milliseconds STORE_LOCK_PAUSE(200);
constexpr unsigned int STORE_LOCK_RETRY = 2; // milliseconds

// Retries quietly throughout one pause: a search holds the lock for a fraction of the pause, and a
// waiter should not sleep on when it is free again. True when the lock was taken.
inline bool TryDuringPause(CStoreLock* pLock)
{
    using Clock = std::chrono::steady_clock;
    const Clock::time_point end = Clock::now() + STORE_LOCK_PAUSE;
    do
    {
        Sleep(STORE_LOCK_RETRY);
        if (pLock->TryLockQuietly() == LOCK_TAKEN)
        {
            return true;
        }
    } while (Clock::now() < end);
    return false;
}

// Tries a few times to take the store lock. After each refusal it pauses as above; if the lock did
// not become free meanwhile, it calls fnRefused with the number of the attempt, from 0. False when
// all attempts failed.
template <typename FnRefused>
bool TryStoreLock(CStoreLock* pLock, FnRefused fnRefused)
{
    for (int i = 0; i < STORE_LOCK_ATTEMPTS; ++i)
    {
        if (pLock->TryLock() == LOCK_TAKEN || TryDuringPause(pLock))
        {
            return true;
        }
        fnRefused(i);
    }
    return false;
}

// Takes the store lock by fnTry, which returns a LOCK_RESULT. Waits without limit while somebody
// else holds it, with uPause milliseconds and the error line szRefused between attempts; false
// after STORE_LOCK_ATTEMPTS in which the lock file could not be opened, which waiting may not fix.
template <typename FnTry>
bool WaitForStoreLock(FnTry fnTry, unsigned int uPause, const char* szRefused)
{
    int iUnavailable = 0;
    while (iUnavailable < STORE_LOCK_ATTEMPTS)
    {
        const LOCK_RESULT eResult = fnTry();
        if (eResult == LOCK_TAKEN)
        {
            return true;
        }
        iUnavailable += eResult == LOCK_UNAVAILABLE ? 1 : 0;
        QV_LOGE(QV_LOG_TAG, "%s", szRefused);
        Sleep(uPause);
    }
    return false;
}

#endif
