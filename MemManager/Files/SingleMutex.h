#ifndef QV_MEMMANAGER_FILES_SINGLEMUTEX_H
#define QV_MEMMANAGER_FILES_SINGLEMUTEX_H

#include "Common/Export.h"

// What an attempt at the lock came to.
enum LOCK_RESULT
{
    LOCK_TAKEN,
    LOCK_REFUSED,    // somebody else holds it: it will be free again
    LOCK_UNAVAILABLE // the lock file cannot be opened or locked, which waiting may not mend
};

// The store lock: an exclusive advisory lock on the file memlock.ini. It belongs to one open of
// that file, so it excludes other threads and other holders of the same process as well as other
// processes, and it is free again as soon as its process dies. Programs that the process starts
// do not inherit it; a child that was forked without starting a program shares it and keeps it
// until it dies too.
//
// The lock's state lives in an int of the caller, its holder: the open descriptor while the lock
// is held, 0 while nothing is. Holders start at 0. A descriptor is never 0 here, not even in a
// process whose standard input is closed.
class QV_EXPORT CSingleMutex
{
public:
    // Takes the lock without waiting: 1 when it is now held, 0 when somebody else holds it or
    // the file cannot be opened; *pFd is 0 then. pFd null: 0. The lock file is created empty if
    // missing, with permission bits 0777; the file-creation mask becomes 0 and stays so.
    // Callers that want to wait call again after a pause of their own.
    static int Lock(int* pFd);

    // Releases the lock: 1, also when nothing was held (*pFd 0); 0 on failure or when pFd is
    // null. *pFd keeps its value: a caller that keeps the holder sets it to 0, and UnLock is
    // called once for each Lock that returned 1. A descriptor that was closed by somebody else,
    // and may be another file by now, is left alone: that is a failure.
    static int UnLock(int* pFd);

    // As Lock, telling the two failures apart; errno is that of the failing step after
    // LOCK_UNAVAILABLE. TryLockQuietly writes no log line.
    QV_INTERNAL static LOCK_RESULT TryLock(int* pFd);
    QV_INTERNAL static LOCK_RESULT TryLockQuietly(int* pFd);

    // Whether a holder's descriptor is still open and still the lock file. False after somebody
    // closed it, which has released the lock.
    QV_INTERNAL static bool IsHeld(int iFd);
};

#endif
