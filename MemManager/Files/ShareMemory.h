#ifndef QV_MEMMANAGER_FILES_SHAREMEMORY_H
#define QV_MEMMANAGER_FILES_SHAREMEMORY_H

// Files that processes share by mapping them. A mapping is identified by its start address; the
// failure value is the address -1 (MAP_FAILED of <sys/mman.h>). The opener of a mapping closes it
// once, with the same size. No call takes the store lock or retries; each failing step writes one
// error line. Sizes are bytes. A null path fails like a file that does not exist.

#include "Common/Export.h"

#include <cstddef>

extern "C"
{
    // Maps the first uSize bytes of the file for shared reading and writing. The process's
    // file-creation mask is set to 0 and stays so; a missing file is created with permission bits
    // 0777. A file shorter than uSize is extended with zero bytes, a longer one keeps its length;
    // the byte at uSize - 1 becomes 0.
    // Disk space is allocated for every byte of the range before it is mapped, so that a write
    // through the mapping cannot kill the process. Where the system cannot reserve space, zeros
    // are written past the file's end and over every block that reads as zeros, which takes a read
    // of the whole range.
    // When the file cannot have that size (disk full: ENOSPC; above the process's file-size
    // limit: EFBIG; size 0: EINVAL), its old length is restored and -1 is returned, with the
    // line of a failed mapping. A file that was created then stays, empty. A file that reached
    // the size but cannot be mapped keeps it: others may use it already. Calls that extend the
    // same file wait for each other.
    QV_EXPORT void* OpenWriteShareMemory(const char* szPath, size_t uSize);

    // Maps the first uSize bytes of an existing file, private and read-only; creates and changes
    // nothing. A file shorter than uSize fails like a failed mapping (ENXIO): an access past its
    // end would kill the process. What other processes write later may or may not be visible in
    // the mapping, so store files are read under the store lock.
    QV_EXPORT void* OpenReadShareMemory(const char* szPath, size_t uSize);

    // Flushes and unmaps, also if the flush fails. bSync other than 0 waits until the bytes are on
    // the disk. A null address does nothing.
    QV_EXPORT void CloseWriteShareMemory(void* pAddr, size_t uSize, int bSync);

    // Unmaps. 0 when that succeeded or the address is null, else non-zero.
    QV_EXPORT int CloseReadShareMemory(void* pAddr, size_t uSize);

    // --- For callers outside: nothing in the library calls these ---

    // As OpenWriteShareMemory, and CloseWriteShareMemory with bSync 0; only the texts of the log
    // lines differ.
    QV_EXPORT void* OpenShareMemory(const char* szPath, size_t uSize);
    QV_EXPORT void CloseShareMemory(void* pAddr, size_t uSize);

    // Replaces the content of the file by iLen bytes; a missing file is created with 0777 less the
    // process's mask. 1, or 0: null argument, negative length (nothing is opened then), failed
    // open or a write of fewer bytes.
    QV_EXPORT int writeToFile(const char* szPath, const void* pBuf, int iLen);

    // Reads up to *piLen bytes from the start of the file with one read, whose result (a count,
    // 0 at the end of the file, -1) is left in *piLen. 1, or 0 with *piLen as it was: null
    // argument, negative length, failed open.
    QV_EXPORT int readFromFile(const char* szPath, void* pBuf, int* piLen);
}

#endif
