#include "MemManager/SingleMutex.h"

#include "Common/DataPaths.h"
#include "Common/Log.h"

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
    close(iFd);
    return iMoved;
}

int OpenLockFile()
{
    umask(0);
    return MoveAboveStandard(
        open(CDataPaths::LockFile(), O_RDWR | O_CREAT | O_CLOEXEC, LOCK_FILE_MODE));
}

int LogLockResult(int iResult)
{
    QV_LOGD(QV_LOG_TAG, "QV_Contacts:LOCK RET = %d ", iResult);
    return iResult;
}

int LogUnlockResult(int iResult)
{
    QV_LOGD(QV_LOG_TAG, "QV_Contacts:UNLOCK RET = %d ", iResult);
    return iResult;
}

} // namespace

int CSingleMutex::Lock(int* pFd)
{
    QV_LOGD(QV_LOG_TAG, "QV_Contacts:Lock TRY LOCK");
    if (pFd == nullptr)
    {
        return 0;
    }
    *pFd = OpenLockFile();
    if (*pFd > 0 && flock(*pFd, LOCK_EX | LOCK_NB) == 0)
    {
        return LogLockResult(1);
    }
    if (*pFd > 0)
    {
        close(*pFd);
    }
    *pFd = 0;
    return LogLockResult(0);
}

int CSingleMutex::UnLock(int* pFd)
{
    QV_LOGD(QV_LOG_TAG, "QV_Contacts:UnLock TRY UNLOCK");
    if (pFd == nullptr)
    {
        return 0;
    }
    if (*pFd == 0)
    {
        return LogUnlockResult(1);
    }
    const bool bReleased = flock(*pFd, LOCK_UN) == 0;
    close(*pFd);
    return LogUnlockResult(bReleased ? 1 : 0);
}
