#include "MemManager/Files/SingleMutex.h"

#include "Common/DataPaths.h"
#include "Common/Log.h"
#include "MemManager/Files/StoreFile.h"

#include <cerrno>
#include <fcntl.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <unistd.h>

namespace
{

constexpr mode_t LOCK_FILE_MODE = 0777;
constexpr int FIRST_FREE_FD = STDERR_FILENO + 1;

// Moves a descriptor above those of the standard streams: 0 means in a holder that nothing is
// held. -1 when there is none left.
int MoveAboveStandard(int iFd)
{
    if (iFd < 0 || iFd >= FIRST_FREE_FD)
    {
        return iFd;
    }
    const int iMoved = fcntl(iFd, F_DUPFD_CLOEXEC, FIRST_FREE_FD);
    const int iError = errno;
    close(iFd);
    errno = iError;
    return iMoved;
}

int OpenLockFile()
{
    umask(0);
    return MoveAboveStandard(
        OpenStoreFile(CDataPaths::LockFile(), O_RDWR | O_CREAT, LOCK_FILE_MODE));
}

// Locks the open file. A refusal or failure closes it.
LOCK_RESULT LockOpenFile(int iFd)
{
    if (flock(iFd, LOCK_EX | LOCK_NB) == 0)
    {
        return LOCK_TAKEN;
    }
    const int iError = errno;
    close(iFd);
    errno = iError;
    return iError == EWOULDBLOCK || iError == EINTR ? LOCK_REFUSED : LOCK_UNAVAILABLE;
}

// Whether an open file is the lock file, or was until that was deleted.
bool IsLockFile(const struct stat& opened)
{
    struct stat named = {};
    if (stat(CDataPaths::LockFile(), &named) == 0 && named.st_dev == opened.st_dev &&
        named.st_ino == opened.st_ino)
    {
        return true;
    }
    return S_ISREG(opened.st_mode) && opened.st_nlink == 0 && opened.st_size == 0;
}

bool ReleaseLock(int iFd)
{
    if (!CSingleMutex::IsHeld(iFd))
    {
        return false;
    }
    const bool bReleased = flock(iFd, LOCK_UN) == 0;
    close(iFd);
    return bReleased;
}

int LogUnlockResult(int iResult)
{
    QV_LOGD(QV_LOG_TAG, "QV_Contacts:UNLOCK RET = %d ", iResult);
    return iResult;
}

} // namespace

LOCK_RESULT CSingleMutex::TryLockQuietly(int* pFd)
{
    *pFd = 0;
    const int iFd = OpenLockFile();
    const LOCK_RESULT eResult = iFd < 0 ? LOCK_UNAVAILABLE : LockOpenFile(iFd);
    if (eResult == LOCK_TAKEN)
    {
        *pFd = iFd;
    }
    return eResult;
}

LOCK_RESULT CSingleMutex::TryLock(int* pFd)
{
    QV_LOGD(QV_LOG_TAG, "QV_Contacts:Lock TRY LOCK");
    const LOCK_RESULT eResult = TryLockQuietly(pFd);
    const int iError = errno;
    QV_LOGD(QV_LOG_TAG, "QV_Contacts:LOCK RET = %d ", eResult == LOCK_TAKEN ? 1 : 0);
    errno = iError;
    return eResult;
}

int CSingleMutex::Lock(int* pFd)
{
    if (pFd == nullptr)
    {
        QV_LOGD(QV_LOG_TAG, "QV_Contacts:Lock TRY LOCK");
        return 0;
    }
    return TryLock(pFd) == LOCK_TAKEN ? 1 : 0;
}

int CSingleMutex::UnLock(int* pFd)
{
    QV_LOGD(QV_LOG_TAG, "QV_Contacts:UnLock TRY UNLOCK");
    if (pFd == nullptr)
    {
        return 0;
    }
    return LogUnlockResult(*pFd == 0 || ReleaseLock(*pFd) ? 1 : 0);
}

bool CSingleMutex::IsHeld(int iFd)
{
    struct stat opened = {};
    return iFd > 0 && fstat(iFd, &opened) == 0 && IsLockFile(opened);
}
