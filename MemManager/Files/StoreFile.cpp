#include "MemManager/Files/StoreFile.h"

#include <cerrno>
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

int OpenStoreFile(const char* szPath, int iFlags, mode_t uMode)
{
    const int iFd = open(szPath, iFlags | O_NONBLOCK | O_NOCTTY | O_CLOEXEC, uMode);
    if (iFd < 0)
    {
        return -1;
    }
    struct stat info = {};
    const int iError = fstat(iFd, &info) != 0 ? errno : EINVAL;
    if (S_ISREG(info.st_mode))
    {
        return iFd;
    }
    close(iFd);
    errno = iError;
    return -1;
}
