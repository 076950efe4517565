#include "MemManager/Files/StoreLock.h"

#include "Common/DataPaths.h"

#include <climits>
#include <cstdio>
#include <cstring>
#include <fcntl.h>
#include <sys/file.h>

namespace
{

int OpenStoreDirectory()
{
    const char* szFile = CDataPaths::LockFile();
    char szDirectory[PATH_MAX];
    std::snprintf(szDirectory, sizeof(szDirectory), "%.*s",
                  static_cast<int>(std::strrchr(szFile, '/') - szFile), szFile);
    return open(szDirectory, O_RDONLY | O_DIRECTORY | O_CLOEXEC);
}

int LockWaiting(int iFd)
{
    int iRet = 0;
    do
    {
        iRet = flock(iFd, LOCK_EX);
    } while (iRet != 0 && errno == EINTR);
    return iRet;
}

} // namespace

bool CWriterLock::Take()
{
    m_directory.Reset(OpenStoreDirectory());
    if (m_directory.IsOpen() && LockWaiting(m_directory.Get()) != 0)
    {
        m_directory.Reset();
    }
    return m_directory.IsOpen();
}

void CWriterLock::Release()
{
    if (m_directory.IsOpen())
    {
        flock(m_directory.Get(), LOCK_UN);
    }
    m_directory.Reset();
}
