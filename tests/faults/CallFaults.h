#ifndef QV_TESTS_FAULTS_CALLFAULTS_H
#define QV_TESTS_FAULTS_CALLFAULTS_H

// The C library's calls as this program and the libraries in it make them. The program defines
// them itself and hands them on, so that one can be made to fail and mappings can be watched.

#include <cstddef>

enum CALL_GROUP
{
    CALLS_NONE,
    CALLS_FILES, // opening, reading, writing, mapping, locking and flushing below the data root
    CALLS_ROOM,  // those of them that may need room on the disk
    CALLS_LOCK,  // flock
    CALLS_MEMORY // malloc, calloc, realloc and with them new
};

// For as long as the object lives, the calls of a group succeed iGranted times; then one of them
// fails with iError, or all do. Nothing sleeps meanwhile. One object at a time, in one thread.
class CCallFault
{
public:
    CCallFault(CALL_GROUP eGroup, int iGranted, int iError, bool bOnce);
    ~CCallFault();
    CCallFault(const CCallFault&) = delete;
    CCallFault& operator=(const CCallFault&) = delete;

    // The first call that failed, "" while none has.
    static const char* Failed();
};

// Is told of each mapping of a file below the data root after it was made, after it was flushed to
// the disk and before it goes.
// What it calls itself is neither counted nor told.
class CMapWatch
{
public:
    virtual void Mapped(void* pAddr, size_t uSize, int iProt, int iFlags, const char* szFile) = 0;
    virtual void Flushed(const char* szFile) = 0;
    virtual void Unmapping(void* pAddr, const char* szFile) = 0;
    // Null ends the watch.
    static void Set(CMapWatch* pWatch);

protected:
    ~CMapWatch() = default;
};

#endif
