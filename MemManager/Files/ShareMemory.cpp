#include "MemManager/Files/ShareMemory.h"

#include "Common/Log.h"
#include "MemManager/Files/Descriptor.h"

#include <algorithm>
#include <cerrno>
#include <cstdint>
#include <cstring>
#include <fcntl.h>
#include <limits>
#include <sys/file.h>
#include <sys/mman.h>
#include <sys/resource.h>
#include <sys/stat.h>
#include <unistd.h>

namespace
{

constexpr mode_t SHARED_FILE_MODE = 0777;

constexpr off_t ZERO_PAGE_SIZE = 4096;
constexpr char ZERO_PAGE[ZERO_PAGE_SIZE] = {};
constexpr off_t SMALLEST_BLOCK = 1024; // of the file systems that cannot reserve space

// The outcome of an open call. pAddr is MAP_FAILED on failure; iFd is then -1 if the file could not
// be opened, else the number of the descriptor, which is already closed.
struct tag_OpenOutcome
{
    void* pAddr;
    int iFd;
    int iError; // errno of the failing step
};

const char* PathOrEmpty(const char* szPath)
{
    return szPath == nullptr ? "" : szPath;
}

// A write past the process's file-size limit raises a signal that ends the process, even if the
// file is already that long.
bool IsAboveSizeLimit(size_t uSize)
{
    if (uSize > static_cast<size_t>(std::numeric_limits<off_t>::max()))
    {
        return true;
    }
    rlimit limit = {};
    return getrlimit(RLIMIT_FSIZE, &limit) == 0 && uSize > limit.rlim_cur;
}

// Whether the error means that the system cannot reserve space for this file at all.
bool CannotReserve(int iError)
{
    return iError == EOPNOTSUPP || iError == EINVAL || iError == ENOSYS || iError == EPERM;
}

// Has the system allocate disk space for the first iSize bytes; 0 or errno.
int ReserveSpace(int iFd, off_t iSize)
{
#if defined(__ANDROID__) && __ANDROID_API__ < 21
    // The platform's C library has no call for it yet.
    (void)iFd;
    (void)iSize;
    return ENOSYS;
#else
    int iResult = 0;
    do
    {
        iResult = fallocate(iFd, 0, 0, iSize);
    } while (iResult != 0 && errno == EINTR);
    return iResult == 0 ? 0 : errno;
#endif
}

// Writes zeros at iFrom, up to the next whole page but not past iEnd. Returns how many, or -1.
ssize_t WriteZeros(int iFd, off_t iFrom, off_t iEnd)
{
    const off_t iNum = std::min(iEnd - iFrom, ZERO_PAGE_SIZE - iFrom % ZERO_PAGE_SIZE);
    errno = EIO; // for a write of 0 bytes, which sets no errno
    const ssize_t iWritten = pwrite(iFd, ZERO_PAGE, static_cast<size_t>(iNum), iFrom);
    return iWritten > 0 ? iWritten : -1;
}

// Fills iFrom to iEnd with zeros; 0 or errno.
int FillWithZeros(int iFd, off_t iFrom, off_t iEnd)
{
    while (iFrom < iEnd)
    {
        const ssize_t iWritten = WriteZeros(iFd, iFrom, iEnd);
        if (iWritten < 0 && errno != EINTR)
        {
            return errno;
        }
        iFrom += std::max<ssize_t>(iWritten, 0);
    }
    return 0;
}

// Fills the holes of the first iEnd bytes; 0 or errno. Not every file system reports its holes, so
// every block that reads as zeros is written again.
int FillHoles(int iFd, off_t iEnd)
{
    char acBlock[SMALLEST_BLOCK];
    for (off_t iFrom = 0; iFrom < iEnd; iFrom += SMALLEST_BLOCK)
    {
        const ssize_t iRead = pread(iFd, acBlock, sizeof(acBlock), iFrom);
        if (iRead < 0)
        {
            return errno;
        }
        const bool bZeros = std::memcmp(acBlock, ZERO_PAGE, static_cast<size_t>(iRead)) == 0;
        const int iError =
            bZeros ? FillWithZeros(iFd, iFrom, std::min<off_t>(iFrom + iRead, iEnd)) : 0;
        if (iError != 0)
        {
            return iError;
        }
    }
    return 0;
}

// Makes a file of iLength bytes at least iSize bytes long and all of these written; 0 or errno.
int ExtendFile(int iFd, off_t iLength, off_t iSize)
{
    int iError = ReserveSpace(iFd, iSize);
    if (CannotReserve(iError))
    {
        iError = FillHoles(iFd, std::min(iLength, iSize));
        iError = iError == 0 ? FillWithZeros(iFd, iLength, iSize) : iError;
    }
    return iError;
}

// The length of a file, -1 with errno.
off_t FileLength(int iFd)
{
    struct stat info = {};
    return fstat(iFd, &info) == 0 ? static_cast<off_t>(info.st_size) : -1;
}

// Frees what a failed extension allocated, also past the end that the file still has. A file that
// reached its new length keeps it: others may use it already.
void GiveBack(int iFd, off_t iLength, off_t iSize)
{
    const off_t iReached = FileLength(iFd);
    if (iReached >= iLength && iReached < iSize)
    {
        static_cast<void>(!ftruncate(iFd, iLength));
    }
}

// Makes the file at least iSize bytes long, with disk space for all of them; 0 or errno. An
// extension locks the file, so that a failing one does not truncate what another has extended.
int ReserveFile(int iFd, off_t iSize)
{
    const off_t iLength = FileLength(iFd);
    if (iLength < 0)
    {
        return errno;
    }
    if (iLength >= iSize)
    {
        return ExtendFile(iFd, iLength, iSize);
    }
    const bool bAlone = flock(iFd, LOCK_EX) == 0;
    const off_t iLockedLength = FileLength(iFd);
    if (iLockedLength < 0)
    {
        return errno;
    }
    const int iError = ExtendFile(iFd, iLockedLength, iSize);
    if (iError != 0 && bAlone)
    {
        GiveBack(iFd, iLockedLength, iSize);
    }
    return iError;
}

// Extends and maps an open file and makes the last byte of the range 0.
void* MapShared(int iFd, size_t uSize, int* piError)
{
    if (uSize == 0 || IsAboveSizeLimit(uSize))
    {
        *piError = uSize == 0 ? EINVAL : EFBIG;
        return MAP_FAILED;
    }
    *piError = ReserveFile(iFd, static_cast<off_t>(uSize));
    if (*piError != 0)
    {
        return MAP_FAILED;
    }
    void* pAddr = mmap(nullptr, uSize, PROT_READ | PROT_WRITE, MAP_SHARED, iFd, 0);
    if (pAddr == MAP_FAILED)
    {
        *piError = errno;
        return MAP_FAILED;
    }
    *piError = FillWithZeros(iFd, static_cast<off_t>(uSize) - 1, static_cast<off_t>(uSize));
    if (*piError != 0)
    {
        munmap(pAddr, uSize);
        return MAP_FAILED;
    }
    return pAddr;
}

// Maps an open file, which has to be long enough.
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

// Maps what OpenStoreFile opened, or failed to open.
tag_OpenOutcome MapOpened(int iFd, size_t uSize, void* (*pfnMap)(int, size_t, int*))
{
    tag_OpenOutcome outcome = {MAP_FAILED, iFd, errno};
    const CDescriptor file(iFd);
    if (file.IsOpen())
    {
        outcome.pAddr = pfnMap(iFd, uSize, &outcome.iError);
    }
    return outcome;
}

tag_OpenOutcome OpenForWriting(const char* szPath, size_t uSize)
{
    umask(0);
    return MapOpened(OpenStoreFile(szPath, O_RDWR | O_CREAT, SHARED_FILE_MODE), uSize, MapShared);
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
    const tag_OpenOutcome outcome = MapOpened(OpenStoreFile(szPath, O_RDONLY), uSize, MapPrivate);
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
    const CDescriptor file(open(szPath, O_RDWR | O_CREAT | O_TRUNC | O_CLOEXEC, SHARED_FILE_MODE));
    if (!file.IsOpen())
    {
        QV_LOGE(QV_LOG_TAG, "QV_Contacts: writeToFile open error = %d, %s\n", errno,
                std::strerror(errno));
        return 0;
    }
    if (write(file.Get(), pBuf, static_cast<size_t>(iLen)) != iLen)
    {
        QV_LOGE(QV_LOG_TAG, "QV_Contacts: writeToFile write error = %d, %s\n", errno,
                std::strerror(errno));
        return 0;
    }
    return 1;
}

int readFromFile(const char* szPath, void* pBuf, int* piLen)
{
    if (szPath == nullptr || pBuf == nullptr || piLen == nullptr || *piLen < 0)
    {
        return 0;
    }
    const CDescriptor file(open(szPath, O_RDONLY | O_CLOEXEC));
    if (!file.IsOpen())
    {
        QV_LOGE(QV_LOG_TAG, "QV_Contacts: readFromFile open error = %d, %s\n", errno,
                std::strerror(errno));
        return 0;
    }
    *piLen = static_cast<int>(read(file.Get(), pBuf, static_cast<size_t>(*piLen)));
    return 1;
}
