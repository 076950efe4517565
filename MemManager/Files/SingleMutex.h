#ifndef QV_MEMMANAGER_FILES_SINGLEMUTEX_H
#define QV_MEMMANAGER_FILES_SINGLEMUTEX_H

#include "Common/Export.h"

// The outcome of an attempt to take the lock.
enum LOCK_RESULT
{
    LOCK_TAKEN,
    LOCK_REFUSED,    // another holder has it and will release it
    LOCK_UNAVAILABLE // the lock file cannot be opened or locked, which waiting may not fix
};

// The store lock: an exclusive advisory lock on the file memlock.ini. It belongs to one open of
// that file, so it excludes other threads and other holders of the same process as well as other
// processes, and the system releases it when its process dies. Programs that the process starts
// do not inherit it; a child that was forked without starting a program shares it and keeps it
// until it dies too.
//
// The caller keeps the lock's state in an int, the holder: the open descriptor while the lock is
// held, else 0. Holders start at 0. The descriptor is never 0, not even in a process whose standard
// input is closed.
class QV_EXPORT CSingleMutex
{
public:
    // Takes the lock without waiting: 1 when it is now held, 0 when somebody else holds it or
    // the file cannot be opened; *pFd is 0 then. pFd null: 0. The lock file is created empty if
    // missing, with permission bits 0777; the file-creation mask becomes 0 and stays so.
    // Callers that want to wait call again after a pause of their own.
    static int Lock(int* pFd);

    // Releases the lock: 1, also when nothing was held (*pFd 0); 0 on failure or when pFd is
    // null. *pFd keeps its value: a caller that uses the holder again sets it to 0. Call UnLock
    // once for each Lock that returned 1. It fails without touching a descriptor that somebody
    // else closed, which may be another file by now.
    static int UnLock(int* pFd);

    // As Lock, telling the two failures apart; errno is that of the failing step after
    // LOCK_UNAVAILABLE. TryLockQuietly writes no log line.
    QV_INTERNAL static LOCK_RESULT TryLock(int* pFd);
    QV_INTERNAL static LOCK_RESULT TryLockQuietly(int* pFd);

    // Whether a holder's descriptor is still open and still the lock file. False if somebody closed
    // it, which released the lock.
    QV_INTERNAL static bool IsHeld(int iFd);
};

#endif
