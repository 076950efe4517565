#include "MemManager/ShareMemory.h"

#include "Common/Log.h"
#include "MemManager/StoreFile.h"

#include <cerrno>
#include <cstdint>
#include <cstring>
#include <fcntl.h>
#include <limits>
#include <sys/mman.h>
#include <sys/resource.h>
#include <sys/stat.h>
#include <unistd.h>

namespace
{

constexpr mode_t SHARED_FILE_MODE = 0777;

// What became of an open call. pAddr is MAP_FAILED on failure; iFd is then -1 when the file could
// not be opened, else the number of the descriptor, which is closed by now.
struct tag_OpenOutcome
{
    void* pAddr;
    int iFd;
    int iError; // errno of the failing step
};

// The end of a file as it was before it was extended.
struct tag_FileEnd
{
    off_t iLength;
    char cLast; // the byte that becomes 0, when the file reaches so far
};

const char* PathOrEmpty(const char* szPath)
{
    return szPath == nullptr ? "" : szPath;
}

// Writing behind the process's file-size limit would raise a signal that ends the process, also
// where the file is that long already.
bool IsAboveSizeLimit(size_t uSize)
{
    if (uSize > static_cast<size_t>(std::numeric_limits<off_t>::max()))
    {
        return true;
    }
    rlimit limit = {};
    return getrlimit(RLIMIT_FSIZE, &limit) == 0 && uSize > limit.rlim_cur;
}

// Whether a refusal to reserve space means that this file system never reserves any.
bool CannotReserve(int iError)
{
    return iError == EOPNOTSUPP || iError == EINVAL || iError == ENOSYS;
}

// Gives every byte of the range its place on the disk; 0 or errno.
int ReserveSpace(int iFd, off_t iSize)
{
#if defined(__ANDROID__) && __ANDROID_API__ < 21
    // The platform's C library has no call for it yet.
    (void)iFd;
    (void)iSize;
    return 0;
#else
    int iResult = 0;
    do
    {
        iResult = fallocate(iFd, 0, 0, iSize);
    } while (iResult != 0 && errno == EINTR);
    return iResult == 0 || CannotReserve(errno) ? 0 : errno;
#endif
}

// Notes how the file ends; 0 or errno.
int ReadFileEnd(int iFd, off_t iSize, tag_FileEnd* pEnd)
{
    struct stat info = {};
    if (fstat(iFd, &info) != 0)
    {
        return errno;
    }
    pEnd->iLength = static_cast<off_t>(info.st_size);
    pEnd->cLast = 0;
    errno = EIO; // in case that nothing is read without an error
    if (pEnd->iLength >= iSize && pread(iFd, &pEnd->cLast, 1, iSize - 1) != 1)
    {
        return errno;
    }
    return 0;
}

void RestoreFileEnd(int iFd, off_t iSize, const tag_FileEnd& end)
{
    if (end.iLength < iSize)
    {
        (void)!ftruncate(iFd, end.iLength);
    }
    else
    {
        (void)!pwrite(iFd, &end.cLast, 1, iSize - 1);
    }
}

// Makes the file at least iSize bytes long, all of them on the disk, the last of them 0; 0 or
// errno.
int ExtendFile(int iFd, off_t iSize)
{
    const int iError = ReserveSpace(iFd, iSize);
    if (iError != 0)
    {
        return iError;
    }
    const char cZero = 0;
    errno = EIO; // in case that nothing is written without an error
    return pwrite(iFd, &cZero, 1, iSize - 1) == 1 ? 0 : errno;
}

// Extends and maps an open file; what was changed is taken back on failure.
void* MapShared(int iFd, size_t uSize, int* piError)
{
    if (uSize == 0 || IsAboveSizeLimit(uSize))
    {
        *piError = uSize == 0 ? EINVAL : EFBIG;
        return MAP_FAILED;
    }
    const off_t iSize = static_cast<off_t>(uSize);
    tag_FileEnd end = {};
    *piError = ReadFileEnd(iFd, iSize, &end);
    if (*piError != 0)
    {
        return MAP_FAILED;
    }
    void* pAddr = MAP_FAILED;
    *piError = ExtendFile(iFd, iSize);
    if (*piError == 0)
    {
        pAddr = mmap(nullptr, uSize, PROT_READ | PROT_WRITE, MAP_SHARED, iFd, 0);
        *piError = errno;
    }
    if (pAddr == MAP_FAILED)
    {
        RestoreFileEnd(iFd, iSize, end);
    }
    return pAddr;
}

tag_OpenOutcome OpenForWriting(const char* szPath, size_t uSize)
{
    umask(0);
    tag_OpenOutcome outcome = {MAP_FAILED, -1, 0};
    outcome.iFd = OpenStoreFile(szPath, O_RDWR | O_CREAT, SHARED_FILE_MODE);
    if (outcome.iFd < 0)
    {
        outcome.iError = errno;
        return outcome;
    }
    outcome.pAddr = MapShared(outcome.iFd, uSize, &outcome.iError);
    close(outcome.iFd);
    return outcome;
}

// Maps an open file that has to be long enough already.
void* MapPrivate(int iFd, size_t uSize, int* piError)
{
    struct stat info = {};
    if (uSize == 0 || fstat(iFd, &info) != 0)
    {
        *piError = uSize == 0 ? EINVAL : errno;
        return MAP_FAILED;
    }
    if (static_cast<uintmax_t>(info.st_size) < uSize)
    {
        *piError = ENXIO;
        return MAP_FAILED;
    }
    void* pAddr = mmap(nullptr, uSize, PROT_READ, MAP_PRIVATE, iFd, 0);
    *piError = errno;
    return pAddr;
}

tag_OpenOutcome OpenForReading(const char* szPath, size_t uSize)
{
    tag_OpenOutcome outcome = {MAP_FAILED, -1, 0};
    outcome.iFd = OpenStoreFile(szPath, O_RDONLY);
    if (outcome.iFd < 0)
    {
        outcome.iError = errno;
        return outcome;
    }
    outcome.pAddr = MapPrivate(outcome.iFd, uSize, &outcome.iError);
    close(outcome.iFd);
    return outcome;
}

bool IsOpenFailure(const tag_OpenOutcome& outcome)
{
    return outcome.pAddr == MAP_FAILED && outcome.iFd < 0;
}

bool IsMapFailure(const tag_OpenOutcome& outcome)
{
    return outcome.pAddr == MAP_FAILED && outcome.iFd >= 0;
}

} // namespace

void* OpenShareMemory(const char* szPath, size_t uSize)
{
    szPath = PathOrEmpty(szPath);
    const tag_OpenOutcome outcome = OpenForWriting(szPath, uSize);
    if (IsOpenFailure(outcome))
    {
        QV_LOGE(QV_LOG_TAG, "QV_Contacts: OpenShareMemory error no2 = %d\n", outcome.iError);
    }
    if (IsMapFailure(outcome))
    {
        QV_LOGE(QV_LOG_TAG, "QV_Contacts: OpenShareMemory:%s, hFile=%d, error:%d : %s", szPath,
                outcome.iFd, outcome.iError, std::strerror(outcome.iError));
    }
    return outcome.pAddr;
}

void* OpenWriteShareMemory(const char* szPath, size_t uSize)
{
    szPath = PathOrEmpty(szPath);
    const tag_OpenOutcome outcome = OpenForWriting(szPath, uSize);
    if (IsOpenFailure(outcome))
    {
        QV_LOGE(QV_LOG_TAG, "QV_Contacts: OpenWriteShareMemory %s error no2 = %d\n", szPath,
                outcome.iError);
    }
    if (IsMapFailure(outcome))
    {
        QV_LOGE(QV_LOG_TAG, "QV_Contacts: OpenWriteShareMemory:%s, hFile=%d, error:%d : %s", szPath,
                outcome.iFd, outcome.iError, std::strerror(outcome.iError));
    }
    return outcome.pAddr;
}

void* OpenReadShareMemory(const char* szPath, size_t uSize)
{
    szPath = PathOrEmpty(szPath);
    const tag_OpenOutcome outcome = OpenForReading(szPath, uSize);
    if (IsOpenFailure(outcome))
    {
        QV_LOGE(QV_LOG_TAG, "QV_Contacts: OpenReadShareMemory:%s error no2 = %d\n", szPath,
                outcome.iError);
    }
    if (IsMapFailure(outcome))
    {
        QV_LOGE(QV_LOG_TAG, "QV_Contacts: OpenReadShareMemory:%s, hFile=%d, error:%d : %s", szPath,
                outcome.iFd, outcome.iError, std::strerror(outcome.iError));
    }
    return outcome.pAddr;
}

void CloseShareMemory(void* pAddr, size_t uSize)
{
    if (pAddr == nullptr)
    {
        return;
    }
    if (msync(pAddr, uSize, MS_ASYNC) != 0)
    {
        QV_LOGE(QV_LOG_TAG, "QV_Contacts: CloseShareMemory msync error:%d=%s", errno,
                std::strerror(errno));
    }
    if (munmap(pAddr, uSize) != 0)
    {
        QV_LOGE(QV_LOG_TAG, "QV_Contacts: CloseShareMemory munmap error:%d=%s", errno,
                std::strerror(errno));
    }
}

void CloseWriteShareMemory(void* pAddr, size_t uSize, int bSync)
{
    if (pAddr == nullptr)
    {
        return;
    }
    if (msync(pAddr, uSize, bSync != 0 ? MS_SYNC : MS_ASYNC) != 0)
    {
        QV_LOGE(QV_LOG_TAG, "QV_Contacts: CloseWriteShareMemory msync error:%d=%s", errno,
                std::strerror(errno));
    }
    if (munmap(pAddr, uSize) != 0)
    {
        QV_LOGE(QV_LOG_TAG, "QV_Contacts: CloseWriteShareMemory munmap error:%d=%s", errno,
                std::strerror(errno));
    }
}

int CloseReadShareMemory(void* pAddr, size_t uSize)
{
    if (pAddr == nullptr)
    {
        return 0;
    }
    const int iResult = munmap(pAddr, uSize);
    if (iResult != 0)
    {
        QV_LOGE(QV_LOG_TAG, "QV_Contacts: CloseReadShareMemory munmap error:%d=%s", errno,
                std::strerror(errno));
    }
    return iResult;
}

int writeToFile(const char* szPath, const void* pBuf, int iLen)
{
    if (szPath == nullptr || pBuf == nullptr || iLen < 0)
    {
        return 0;
    }
    const int iFd = open(szPath, O_RDWR | O_CREAT | O_TRUNC | O_CLOEXEC, SHARED_FILE_MODE);
    if (iFd < 0)
    {
        QV_LOGE(QV_LOG_TAG, "QV_Contacts: writeToFile open error = %d, %s\n", errno,
                std::strerror(errno));
        return 0;
    }
    const bool bWritten = write(iFd, pBuf, static_cast<size_t>(iLen)) == iLen;
    if (!bWritten)
    {
        QV_LOGE(QV_LOG_TAG, "QV_Contacts: writeToFile write error = %d, %s\n", errno,
                std::strerror(errno));
    }
    close(iFd);
    return bWritten ? 1 : 0;
}

int readFromFile(const char* szPath, void* pBuf, int* piLen)
{
    if (szPath == nullptr || pBuf == nullptr || piLen == nullptr || *piLen < 0)
    {
        return 0;
    }
    const int iFd = open(szPath, O_RDONLY | O_CLOEXEC);
    if (iFd < 0)
    {
        QV_LOGE(QV_LOG_TAG, "QV_Contacts: readFromFile open error = %d, %s\n", errno,
                std::strerror(errno));
        return 0;
    }
    *piLen = static_cast<int>(read(iFd, pBuf, static_cast<size_t>(*piLen)));
    close(iFd);
    return 1;
}
