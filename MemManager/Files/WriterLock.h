#ifndef QV_MEMMANAGER_FILES_WRITERLOCK_H
#define QV_MEMMANAGER_FILES_WRITERLOCK_H

#include "MemManager/Files/Descriptor.h"

// What a writer of the store holds beside the store lock, and longer: until its records are on the
// disk and its mark is lifted. Searches need the store lock alone, so they do not wait for the
// disk. An advisory lock on the directory of the store files; like the store lock it excludes
// every other holder and is free as soon as its process dies.
class CWriterLock
{
public:
    // With the store lock in hand; waits for a writer that has released that one already. False
    // when the directory cannot be opened or locked.
    bool Take();
    void Release() { m_directory.Reset(); }

private:
    CDescriptor m_directory;
};

#endif
