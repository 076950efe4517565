#ifndef QV_MEMMANAGER_FILES_STOREFILE_H
#define QV_MEMMANAGER_FILES_STOREFILE_H

#include <sys/types.h>

// Opens a file of the store with the flags of open(2) and, for a file that is created, the
// permission bits. The call never waits, and programs that the process starts do not inherit the
// descriptor. Returns -1 with errno on failure; EINVAL for anything that is not a regular file,
// since a pipe in its place would block a reader that holds the lock.
int OpenStoreFile(const char* szPath, int iFlags, mode_t uMode = 0);

#endif
