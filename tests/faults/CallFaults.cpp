#include "tests/faults/CallFaults.h"

#include "Common/DataPaths.h"

#include <array>
#include <cerrno>
#include <climits>
#include <cstdarg>
#include <cstdio>
#include <cstring>
#include <ctime>
#include <dlfcn.h>
#include <fcntl.h>
#include <initializer_list>
#include <sys/file.h>
#include <sys/mman.h>
#include <unistd.h>

namespace
{

constexpr size_t MAX_FILES = 1024;
constexpr size_t MAX_NAME = 64;

struct tag_Mapping
{
    void* pAddr;
    char szFile[MAX_NAME];
};

// Zero before anything runs: memory is allocated long before main.
CALL_GROUP g_eGroup;
int g_iGranted;
int g_iError;
bool g_bOnce;
bool g_bFaultsOn; // as long as there is a CCallFault, also after its call failed
const char* g_szFailed = "";
CMapWatch* g_pWatch;
char g_aszFiles[MAX_FILES][MAX_NAME]; // by descriptor; empty for files elsewhere
tag_Mapping g_aMappings[MAX_NAME];

bool Fails(std::initializer_list<CALL_GROUP> groups, const char* szCall)
{
    bool bCounts = false;
    for (const CALL_GROUP eGroup : groups)
    {
        bCounts = bCounts || (g_eGroup == eGroup && eGroup != CALLS_NONE);
    }
    if (!bCounts || g_iGranted-- > 0)
    {
        return false;
    }
    g_szFailed = *g_szFailed == 0 ? szCall : g_szFailed;
    g_eGroup = g_bOnce ? CALLS_NONE : g_eGroup;
    g_iGranted = 0;
    errno = g_iError;
    return true;
}

bool IsOurs(int iFd)
{
    return iFd >= 0 && static_cast<size_t>(iFd) < MAX_FILES && g_aszFiles[iFd][0] != 0;
}

// The file's name below the data root; "" for others.
const char* NameBelowRoot(const char* szPath)
{
    const char* szReg = CDataPaths::ContactReg();
    const size_t uRoot = std::strlen(szReg) - std::strlen("/files/ContactsReg.bin");
    return std::strncmp(szPath, szReg, uRoot) == 0 ? std::strrchr(szPath, '/') + 1 : "";
}

template <typename Fn>
Fn Next(Fn /*own*/, const char* szName)
{
    return reinterpret_cast<Fn>(dlsym(RTLD_NEXT, szName));
}

// Runs what a watch does without counting and telling it.
template <typename FnTell>
void Tell(FnTell fnTell)
{
    if (g_pWatch != nullptr)
    {
        CMapWatch* pWatch = g_pWatch;
        const CALL_GROUP eGroup = g_eGroup;
        const int iError = errno;
        g_pWatch = nullptr;
        g_eGroup = CALLS_NONE;
        fnTell(*pWatch);
        g_pWatch = pWatch;
        g_eGroup = eGroup;
        errno = iError;
    }
}

void NoteMapping(void* pAddr, size_t uSize, int iProt, int iFlags, int iFd)
{
    for (tag_Mapping& mapping : g_aMappings)
    {
        if (mapping.pAddr == nullptr)
        {
            mapping.pAddr = pAddr;
            std::memcpy(mapping.szFile, g_aszFiles[iFd], MAX_NAME);
            Tell([&](CMapWatch& watch)
                 { watch.Mapped(pAddr, uSize, iProt, iFlags, mapping.szFile); });
            return;
        }
    }
}

void NoteFlush(const void* pAddr)
{
    for (const tag_Mapping& mapping : g_aMappings)
    {
        if (mapping.pAddr == pAddr)
        {
            Tell([&](CMapWatch& watch) { watch.Flushed(mapping.szFile); });
        }
    }
}

void ForgetMapping(void* pAddr)
{
    for (tag_Mapping& mapping : g_aMappings)
    {
        if (mapping.pAddr == pAddr)
        {
            Tell([&](CMapWatch& watch) { watch.Unmapping(pAddr, mapping.szFile); });
            mapping.pAddr = nullptr;
        }
    }
}

} // namespace

// What a call hands on to; the address is looked up once.
#define QV_NEXT(NAME) static const auto pfnNext = Next(&NAME, #NAME)

// A call that takes a descriptor first and fails with -1.
#define QV_FILE_CALL(RESULT, NAME, PARAMETERS, ARGUMENTS, EXCEPTIONS, ...)                         \
    RESULT NAME PARAMETERS EXCEPTIONS                                                              \
    {                                                                                              \
        QV_NEXT(NAME);                                                                             \
        return IsOurs(iFd) && Fails({CALLS_FILES, __VA_ARGS__}, #NAME) ? -1 : pfnNext ARGUMENTS;   \
    }

#define QV_OPEN_CALL(NAME)                                                                         \
    int NAME(const char* szPath, int iFlags, ...)                                                  \
    {                                                                                              \
        QV_NEXT(NAME);                                                                             \
        va_list arguments;                                                                         \
        va_start(arguments, iFlags);                                                               \
        const int iMode = (iFlags & O_CREAT) != 0 ? va_arg(arguments, int) : 0;                    \
        va_end(arguments);                                                                         \
        const char* szName = NameBelowRoot(szPath);                                                \
        const int iFd =                                                                            \
            *szName != 0 && Fails({CALLS_FILES}, #NAME) ? -1 : pfnNext(szPath, iFlags, iMode);     \
        if (iFd >= 0 && static_cast<size_t>(iFd) < MAX_FILES)                                      \
        {                                                                                          \
            std::snprintf(g_aszFiles[iFd], MAX_NAME, "%s", szName);                                \
        }                                                                                          \
        return iFd;                                                                                \
    }

#define QV_MAP_CALL(NAME, OFFSET)                                                                  \
    void* NAME(void* pAddr, size_t uSize, int iProt, int iFlags, int iFd, OFFSET iOffset) noexcept \
    {                                                                                              \
        QV_NEXT(NAME);                                                                             \
        if (IsOurs(iFd) && Fails({CALLS_FILES}, #NAME))                                            \
        {                                                                                          \
            return MAP_FAILED;                                                                     \
        }                                                                                          \
        void* pMapped = pfnNext(pAddr, uSize, iProt, iFlags, iFd, iOffset);                        \
        if (pMapped != MAP_FAILED && IsOurs(iFd))                                                  \
        {                                                                                          \
            NoteMapping(pMapped, uSize, iProt, iFlags, iFd);                                       \
        }                                                                                          \
        return pMapped;                                                                            \
    }

extern "C"
{
    QV_OPEN_CALL(open)
    QV_OPEN_CALL(open64)
    QV_MAP_CALL(mmap, off_t)
    QV_MAP_CALL(mmap64, off64_t)
    QV_FILE_CALL(ssize_t, read, (int iFd, void* pBuf, size_t uSize), (iFd, pBuf, uSize), ,
                 CALLS_NONE)
    QV_FILE_CALL(ssize_t, pread, (int iFd, void* pBuf, size_t uSize, off_t iAt),
                 (iFd, pBuf, uSize, iAt), , CALLS_NONE)
    QV_FILE_CALL(ssize_t, pread64, (int iFd, void* pBuf, size_t uSize, off64_t iAt),
                 (iFd, pBuf, uSize, iAt), , CALLS_NONE)
    QV_FILE_CALL(ssize_t, write, (int iFd, const void* pBuf, size_t uSize), (iFd, pBuf, uSize), ,
                 CALLS_ROOM)
    QV_FILE_CALL(ssize_t, pwrite, (int iFd, const void* pBuf, size_t uSize, off_t iAt),
                 (iFd, pBuf, uSize, iAt), , CALLS_ROOM)
    QV_FILE_CALL(ssize_t, pwrite64, (int iFd, const void* pBuf, size_t uSize, off64_t iAt),
                 (iFd, pBuf, uSize, iAt), , CALLS_ROOM)
    QV_FILE_CALL(int, ftruncate, (int iFd, off_t iSize), (iFd, iSize), noexcept, CALLS_ROOM)
    QV_FILE_CALL(int, ftruncate64, (int iFd, off64_t iSize), (iFd, iSize), noexcept, CALLS_ROOM)
    QV_FILE_CALL(int, fallocate, (int iFd, int iMode, off_t iAt, off_t iSize),
                 (iFd, iMode, iAt, iSize), , CALLS_ROOM)
    QV_FILE_CALL(int, fallocate64, (int iFd, int iMode, off64_t iAt, off64_t iSize),
                 (iFd, iMode, iAt, iSize), , CALLS_ROOM)

    // Nothing here outlives the machine: the disk is not waited for.
    int fsync(int iFd)
    {
        return IsOurs(iFd) && Fails({CALLS_FILES}, "fsync") ? -1 : 0;
    }

    int fdatasync(int iFd)
    {
        return IsOurs(iFd) && Fails({CALLS_FILES}, "fdatasync") ? -1 : 0;
    }

    int msync(void* pAddr, size_t /*uSize*/, int iFlags)
    {
        if (Fails({CALLS_FILES}, "msync"))
        {
            return -1;
        }
        if ((iFlags & MS_SYNC) != 0)
        {
            NoteFlush(pAddr);
        }
        return 0;
    }

    int flock(int iFd, int iOperation) noexcept
    {
        QV_NEXT(flock);
        const bool bFails = IsOurs(iFd) && Fails({CALLS_FILES, CALLS_LOCK}, "flock");
        return bFails ? -1 : pfnNext(iFd, iOperation);
    }

    int munmap(void* pAddr, size_t uSize) noexcept
    {
        QV_NEXT(munmap);
        ForgetMapping(pAddr);
        return pfnNext(pAddr, uSize);
    }

    int usleep(useconds_t uMicroseconds)
    {
        QV_NEXT(usleep);
        return g_bFaultsOn ? 0 : pfnNext(uMicroseconds);
    }

    int nanosleep(const timespec* pTime, timespec* pRest)
    {
        QV_NEXT(nanosleep);
        return g_bFaultsOn ? 0 : pfnNext(pTime, pRest);
    }

    int clock_nanosleep(clockid_t iClock, int iFlags, const timespec* pTime, timespec* pRest)
    {
        QV_NEXT(clock_nanosleep);
        return g_bFaultsOn ? 0 : pfnNext(iClock, iFlags, pTime, pRest);
    }

    // The sanitizers keep allocation to themselves.
#ifndef __SANITIZE_ADDRESS__
    void* malloc(size_t uSize) noexcept
    {
        QV_NEXT(malloc);
        return Fails({CALLS_MEMORY}, "malloc") ? nullptr : pfnNext(uSize);
    }

    void* calloc(size_t uCount, size_t uSize) noexcept
    {
        QV_NEXT(calloc);
        return Fails({CALLS_MEMORY}, "calloc") ? nullptr : pfnNext(uCount, uSize);
    }

    void* realloc(void* pMemory, size_t uSize) noexcept
    {
        QV_NEXT(realloc);
        return Fails({CALLS_MEMORY}, "realloc") ? nullptr : pfnNext(pMemory, uSize);
    }
#endif
}

CCallFault::CCallFault(CALL_GROUP eGroup, int iGranted, int iError, bool bOnce)
{
    g_szFailed = "";
    g_iGranted = iGranted;
    g_iError = iError;
    g_bOnce = bOnce;
    g_bFaultsOn = true;
    g_eGroup = eGroup;
}

CCallFault::~CCallFault()
{
    g_eGroup = CALLS_NONE;
    g_bFaultsOn = false;
}

const char* CCallFault::Failed()
{
    return g_szFailed;
}

void CMapWatch::Set(CMapWatch* pWatch)
{
    g_pWatch = pWatch;
}
