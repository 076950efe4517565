#include "MemManager/Files/Descriptor.h"

#include <cerrno>
#include <fcntl.h>
#include <sys/stat.h>

int OpenStoreFile(const char* szPath, int iFlags, mode_t uMode)
{
    CDescriptor file(open(szPath, iFlags | O_NONBLOCK | O_NOCTTY | O_CLOEXEC, uMode));
    struct stat info = {};
    if (!file.IsOpen() || fstat(file.Get(), &info) != 0)
    {
        return -1;
    }
    if (!S_ISREG(info.st_mode))
    {
        errno = EINVAL;
        return -1;
    }
    return file.Detach();
}
