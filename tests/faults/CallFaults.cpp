#include "tests/faults/CallFaults.h"

#include "Common/DataPaths.h"

#include <algorithm>
#include <cerrno>
#include <cstdarg>
#include <cstdio>
#include <cstring>
#include <ctime>
#include <dlfcn.h>
#include <fcntl.h>
#include <iterator>
#include <sys/file.h>
#include <sys/mman.h>
#include <unistd.h>
#include <utility>

namespace
{

constexpr size_t MAX_FILES = 1024;

// Zero before anything runs: memory is allocated long before main.
tag_Failures g_failures; // has a name as long as there is a CCallFault
int g_iGranted;
const char* g_szFailed = "";
MapWatch g_pfnWatch;
char g_aszFiles[MAX_FILES][sizeof(tag_Mapping::szFile)]; // by descriptor; empty for files elsewhere
tag_Mapping g_aMappings[64];

bool Fails(unsigned int uGroups, const char* szCall)
{
    if ((g_failures.eGroup & uGroups) == 0 || g_iGranted-- > 0)
    {
        return false;
    }
    g_szFailed = *g_szFailed == 0 ? szCall : g_szFailed;
    g_failures.eGroup = g_failures.bOnce ? CALLS_NONE : g_failures.eGroup;
    g_iGranted = 0;
    errno = g_failures.iError;
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

tag_Mapping* FindMapping(const void* pAddr)
{
    return std::find_if(std::begin(g_aMappings), std::end(g_aMappings),
                        [pAddr](const tag_Mapping& mapping) { return mapping.pAddr == pAddr; });
}

void Tell(MAP_EVENT eEvent, const tag_Mapping& mapping)
{
    if (g_pfnWatch != nullptr)
    {
        const MapWatch pfnWatch = std::exchange(g_pfnWatch, nullptr);
        const int iError = errno;
        pfnWatch(eEvent, mapping);
        g_pfnWatch = pfnWatch;
        errno = iError;
    }
}

} // namespace

// What a call hands on to; the address is looked up once.
#define QV_NEXT(NAME) static const auto pfnNext = Next(&NAME, #NAME)

#define QV_CALL(RESULT, NAME, PARAMETERS, ARGUMENTS, EXCEPTIONS, FAILS, FAILED)                    \
    RESULT NAME PARAMETERS EXCEPTIONS                                                              \
    {                                                                                              \
        QV_NEXT(NAME);                                                                             \
        return (FAILS) ? FAILED : pfnNext ARGUMENTS;                                               \
    }

// A call that takes a descriptor first and fails with -1.
#define QV_FILE_CALL(RESULT, NAME, PARAMETERS, ARGUMENTS, EXCEPTIONS, GROUPS)                      \
    QV_CALL(RESULT, NAME, PARAMETERS, ARGUMENTS, EXCEPTIONS, IsOurs(iFd) && Fails(GROUPS, #NAME),  \
            -1)

#define QV_OPEN_CALL(NAME)                                                                         \
    int NAME(const char* szPath, int iFlags, ...)                                                  \
    {                                                                                              \
        QV_NEXT(NAME);                                                                             \
        va_list arguments;                                                                         \
        va_start(arguments, iFlags);                                                               \
        const int iMode = (iFlags & O_CREAT) != 0 ? va_arg(arguments, int) : 0;                    \
        va_end(arguments);                                                                         \
        const char* szName = NameBelowRoot(szPath);                                                \
        const bool bFails = *szName != 0 && Fails(CALLS_FILES, #NAME);                             \
        const int iFd = bFails ? -1 : pfnNext(szPath, iFlags, iMode);                              \
        if (iFd >= 0 && static_cast<size_t>(iFd) < MAX_FILES)                                      \
        {                                                                                          \
            std::snprintf(g_aszFiles[iFd], sizeof(g_aszFiles[iFd]), "%s", szName);                 \
        }                                                                                          \
        return iFd;                                                                                \
    }

#define QV_MAP_CALL(NAME, OFFSET)                                                                  \
    void* NAME(void* pAddr, size_t uSize, int iProt, int iFlags, int iFd, OFFSET iOffset) noexcept \
    {                                                                                              \
        QV_NEXT(NAME);                                                                             \
        const bool bFails = IsOurs(iFd) && Fails(CALLS_FILES, #NAME);                              \
        void* pMapped = bFails ? MAP_FAILED : pfnNext(pAddr, uSize, iProt, iFlags, iFd, iOffset);  \
        tag_Mapping* pFree = FindMapping(nullptr);                                                 \
        if (pMapped != MAP_FAILED && IsOurs(iFd) && pFree != std::end(g_aMappings))                \
        {                                                                                          \
            *pFree = {pMapped, uSize, iFlags == MAP_SHARED && (iProt & PROT_WRITE) != 0, ""};      \
            std::strcpy(pFree->szFile, g_aszFiles[iFd]);                                           \
            Tell(MAP_MADE, *pFree);                                                                \
        }                                                                                          \
        return pMapped;                                                                            \
    }

extern "C"
{
    constexpr unsigned int CALLS_WRITE = CALLS_FILES | CALLS_ROOM;

    QV_OPEN_CALL(open)
    QV_OPEN_CALL(open64)
    QV_MAP_CALL(mmap, off_t)
    QV_MAP_CALL(mmap64, off64_t)
    QV_FILE_CALL(ssize_t, read, (int iFd, void* pBuf, size_t uSize), (iFd, pBuf, uSize), ,
                 CALLS_FILES)
    QV_FILE_CALL(ssize_t, pread, (int iFd, void* pBuf, size_t uSize, off_t iAt),
                 (iFd, pBuf, uSize, iAt), , CALLS_FILES)
    QV_FILE_CALL(ssize_t, pread64, (int iFd, void* pBuf, size_t uSize, off64_t iAt),
                 (iFd, pBuf, uSize, iAt), , CALLS_FILES)
    QV_FILE_CALL(ssize_t, write, (int iFd, const void* pBuf, size_t uSize), (iFd, pBuf, uSize), ,
                 CALLS_WRITE)
    QV_FILE_CALL(ssize_t, pwrite, (int iFd, const void* pBuf, size_t uSize, off_t iAt),
                 (iFd, pBuf, uSize, iAt), , CALLS_WRITE)
    QV_FILE_CALL(ssize_t, pwrite64, (int iFd, const void* pBuf, size_t uSize, off64_t iAt),
                 (iFd, pBuf, uSize, iAt), , CALLS_WRITE)
    QV_FILE_CALL(int, ftruncate, (int iFd, off_t iSize), (iFd, iSize), noexcept, CALLS_WRITE)
    QV_FILE_CALL(int, ftruncate64, (int iFd, off64_t iSize), (iFd, iSize), noexcept, CALLS_WRITE)
    QV_FILE_CALL(int, fallocate, (int iFd, int iMode, off_t iAt, off_t iSize),
                 (iFd, iMode, iAt, iSize), , CALLS_WRITE)
    QV_FILE_CALL(int, flock, (int iFd, int iOperation), (iFd, iOperation), noexcept,
                 CALLS_FILES | CALLS_LOCK)
    QV_CALL(int, usleep, (useconds_t uMicroseconds), (uMicroseconds), ,
            g_failures.szName != nullptr, 0)
    QV_CALL(int, nanosleep, (const timespec* pTime, timespec* pRest), (pTime, pRest), ,
            g_failures.szName != nullptr, 0)

    // The sanitizers keep allocation to themselves.
#ifndef __SANITIZE_ADDRESS__
    QV_CALL(void*, malloc, (size_t uSize), (uSize), noexcept, Fails(CALLS_MEMORY, "malloc"),
            nullptr)
    QV_CALL(void*, calloc, (size_t uCount, size_t uSize), (uCount, uSize), noexcept,
            Fails(CALLS_MEMORY, "calloc"), nullptr)
    QV_CALL(void*, realloc, (void* pMemory, size_t uSize), (pMemory, uSize), noexcept,
            Fails(CALLS_MEMORY, "realloc"), nullptr)
#endif

    // Nothing here outlives the machine: the disk is not waited for.
    int fdatasync(int iFd)
    {
        const bool bFails = IsOurs(iFd) && Fails(CALLS_FILES, "fdatasync");
        if (IsOurs(iFd) && !bFails)
        {
            tag_Mapping mapping = {nullptr, 0, true, ""};
            std::strcpy(mapping.szFile, g_aszFiles[iFd]);
            Tell(MAP_FLUSHED, mapping);
        }
        return bFails ? -1 : 0;
    }

    int msync(void* pAddr, size_t /*uSize*/, int iFlags)
    {
        if (Fails(CALLS_FILES, "msync"))
        {
            return -1;
        }
        const tag_Mapping* pMapping = FindMapping(pAddr);
        if ((iFlags & MS_SYNC) != 0 && pMapping != std::end(g_aMappings))
        {
            Tell(MAP_FLUSHED, *pMapping);
        }
        return 0;
    }

    int munmap(void* pAddr, size_t uSize) noexcept
    {
        QV_NEXT(munmap);
        tag_Mapping* pMapping = FindMapping(pAddr);
        if (pMapping != std::end(g_aMappings))
        {
            Tell(MAP_ENDS, *pMapping);
            pMapping->pAddr = nullptr;
        }
        return pfnNext(pAddr, uSize);
    }
}

CCallFault::CCallFault(const tag_Failures& failures, int iGranted)
{
    g_szFailed = "";
    g_iGranted = iGranted;
    g_failures = failures;
}

CCallFault::~CCallFault()
{
    g_failures = {};
}

const char* CCallFault::Failed()
{
    return g_szFailed;
}

void WatchMappings(MapWatch pfnWatch)
{
    g_pfnWatch = pfnWatch;
}
