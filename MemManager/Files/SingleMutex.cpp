#include "MemManager/Files/SingleMutex.h"

#include "Common/DataPaths.h"
#include "Common/Log.h"
#include "MemManager/Files/Descriptor.h"

#include <cerrno>
#include <fcntl.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <unistd.h>

namespace
{

constexpr mode_t LOCK_FILE_MODE = 0777;
constexpr int FIRST_FREE_FD = STDERR_FILENO + 1;

// Moves a descriptor above those of the standard streams, since a holder of 0 holds nothing. -1 if
// no descriptor is left.
int MoveAboveStandard(int iFd)
{
    if (iFd < 0 || iFd >= FIRST_FREE_FD)
    {
        return iFd;
    }
    const CDescriptor moved(iFd);
    return fcntl(iFd, F_DUPFD_CLOEXEC, FIRST_FREE_FD);
}

int OpenLockFile()
{
    umask(0);
    return MoveAboveStandard(
        OpenStoreFile(CDataPaths::LockFile(), O_RDWR | O_CREAT, LOCK_FILE_MODE));
}

// Whether an open file is the lock file, or was before the lock file was deleted.
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
    const CDescriptor lock(iFd);
    return flock(iFd, LOCK_UN) == 0;
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
    CDescriptor lock(OpenLockFile());
    if (lock.IsOpen() && flock(lock.Get(), LOCK_EX | LOCK_NB) == 0)
    {
        *pFd = lock.Detach();
        return LOCK_TAKEN;
    }
    const bool bRefused = lock.IsOpen() && (errno == EWOULDBLOCK || errno == EINTR);
    return bRefused ? LOCK_REFUSED : LOCK_UNAVAILABLE;
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
