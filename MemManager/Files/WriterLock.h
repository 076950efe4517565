#ifndef QV_MEMMANAGER_FILES_WRITERLOCK_H
#define QV_MEMMANAGER_FILES_WRITERLOCK_H

#include "MemManager/Files/Descriptor.h"

// A writer of the store takes this lock after the store lock and keeps it longer: until its records
// are on the disk and its mark is lifted. Searches take the store lock alone, so they do not wait
// for the disk. It is an advisory lock on the directory of the store files; like the store lock it
// excludes every other holder, and the system releases it when its process dies.
class CWriterLock
{
public:
    // Call with the store lock held. Waits for a writer that has released the store lock but not
    // yet this one. False if the directory cannot be opened or locked.
    bool Take();
    void Release() { m_directory.Reset(); }

private:
    CDescriptor m_directory;
};

#endif
