#ifndef QV_MEMMANAGER_SINGLEMUTEX_H
#define QV_MEMMANAGER_SINGLEMUTEX_H

#include "Common/Export.h"

// The store lock: an exclusive advisory lock on the file memlock.ini. It belongs to one open of
// that file, so it excludes other threads and other holders of the same process as well as other
// processes, and it is free again as soon as its process dies. Programs that the process starts
// do not inherit it.
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
    // called once for each Lock that returned 1.
    static int UnLock(int* pFd);
};

#endif
