#ifndef QV_MEMMANAGER_FILES_SHAREMEMORY_H
#define QV_MEMMANAGER_FILES_SHAREMEMORY_H

// Files that processes share by mapping them. A mapping is known by its start address; the
// failure value is the address -1 (MAP_FAILED of <sys/mman.h>). Whoever opened a mapping closes
// it with the same size, once. No call here takes a lock, retries or waits; each failure is one
// error line and the result. Sizes are bytes. A null path fails like a file that does not exist.

#include "Common/Export.h"

#include <cstddef>

extern "C"
{
    // Both map the first uSize bytes of the file for shared reading and writing and differ only
    // in the texts of their lines. The process's file-creation mask is set to 0 and stays so; a
    // missing file is created with permission bits 0777. A file shorter than uSize is extended
    // with zero bytes, a longer one keeps its length; the byte at uSize - 1 becomes 0.
    // Every byte of the range gets its place on the disk before it is mapped, so that writing
    // through the mapping cannot kill the process. Where the system cannot reserve space, zeros
    // are written behind the file's end and wherever it reads as zeros; that takes a read of the
    // whole range.
    // When the file cannot have that size (disk full: ENOSPC; above the process's file-size
    // limit: EFBIG; size 0: EINVAL), it gets its old length back and -1 is returned, with the
    // line of a failed mapping. A file that had to be created then stays, empty. Only a file that
    // has reached the size stays so when it then cannot be mapped: others may use it already.
    // Calls that extend the same file wait for each other.
    QV_EXPORT void* OpenShareMemory(const char* szPath, size_t uSize);
    QV_EXPORT void* OpenWriteShareMemory(const char* szPath, size_t uSize);

    // Maps the first uSize bytes of an existing file, private and read-only; creates and changes
    // nothing. A file shorter than uSize fails like a failed mapping (ENXIO): touching pages
    // behind its end would kill the process. What other processes write later may or may not
    // show in the mapping, so store files are read under the store lock.
    QV_EXPORT void* OpenReadShareMemory(const char* szPath, size_t uSize);

    // Flush and unmap; a failing flush does not keep the mapping. bSync other than 0 waits until
    // the bytes are on the disk. A null address does nothing.
    QV_EXPORT void CloseShareMemory(void* pAddr, size_t uSize);
    QV_EXPORT void CloseWriteShareMemory(void* pAddr, size_t uSize, int bSync);

    // Unmaps. 0 when that succeeded or the address is null, else non-zero.
    QV_EXPORT int CloseReadShareMemory(void* pAddr, size_t uSize);

    // Makes iLen bytes the whole content of the file, created if missing with 0777 less the
    // process's mask. 1, or 0: null argument, negative length (nothing is opened then), failed
    // open or a write of fewer bytes.
    QV_EXPORT int writeToFile(const char* szPath, const void* pBuf, int iLen);

    // Reads up to *piLen bytes from the start of the file with one read, whose result (a count,
    // 0 at the end of the file, -1) is left in *piLen. 1, or 0 with *piLen as it was: null
    // argument, negative length, failed open.
    QV_EXPORT int readFromFile(const char* szPath, void* pBuf, int* piLen);
}

#endif
