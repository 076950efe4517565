#ifndef QV_TESTS_FAULTS_CALLFAULTS_H
#define QV_TESTS_FAULTS_CALLFAULTS_H

// The C library's calls as this program and the libraries in it make them. The program defines
// them itself and hands them on, so that one can be made to fail and mappings can be watched.

#include <cstddef>

// Bits: what needs room is a call for files, too.
enum CALL_GROUP : unsigned int
{
    CALLS_NONE = 0,
    CALLS_FILES = 1, // opening, reading, writing, mapping, locking and flushing below the data root
    CALLS_ROOM = 2,  // those of them that may need room on the disk
    CALLS_LOCK = 4,  // flock
    CALLS_MEMORY = 8 // malloc, calloc, realloc and with them new
};

struct tag_Failures
{
    const char* szName;
    CALL_GROUP eGroup;
    int iError;
    bool bOnce; // or all calls from the first that fails on
};

// For as long as the object lives, the calls of a group succeed iGranted times and then fail.
// Nothing sleeps meanwhile. One object at a time, in one thread.
class CCallFault
{
public:
    CCallFault(const tag_Failures& failures, int iGranted);
    ~CCallFault();
    CCallFault(const CCallFault&) = delete;
    CCallFault& operator=(const CCallFault&) = delete;

    // The first call that failed, "" while none has.
    static const char* Failed();
};

// A mapping of a file below the data root.
struct tag_Mapping
{
    void* pAddr;
    size_t uSize;
    bool bWritten; // it writes the file
    char szFile[64];
};

enum MAP_EVENT
{
    MAP_MADE,
    MAP_FLUSHED, // to the disk
    MAP_ENDS
};

// Who is told of mappings, null for nobody; not while calls fail. What it calls itself is not
// told.
using MapWatch = void (*)(MAP_EVENT eEvent, const tag_Mapping& mapping);
void WatchMappings(MapWatch pfnWatch);

#endif
