#include "tests/Support/MemoryFailure.h"

#include <dlfcn.h>

#include <cstddef>
#include <new>

namespace
{

bool g_bActive = false;
int g_iGranted = 0;
int g_iFailures = 0;

bool IsRefused()
{
    if (!g_bActive)
    {
        return false;
    }
    if (g_iGranted > 0)
    {
        --g_iGranted;
        return false;
    }
    ++g_iFailures;
    return true;
}

// What pfnAllocate, an operator new that throws, delivers; null when it is refused.
void* AllocateUnlessRefused(void* (*pfnAllocate)(size_t), size_t uSize) noexcept
{
    try
    {
        return IsRefused() ? nullptr : pfnAllocate(uSize);
    }
    catch (const std::bad_alloc&)
    {
        return nullptr;
    }
}

} // namespace

void* operator new(size_t uSize, const std::nothrow_t& /*tag*/) noexcept
{
    return AllocateUnlessRefused(::operator new, uSize);
}

void* operator new[](size_t uSize, const std::nothrow_t& /*tag*/) noexcept
{
    return AllocateUnlessRefused(::operator new[], uSize);
}

// Takes the C library's place in the test program and hands on to it.
extern "C" void* realloc(void* pMemory, size_t uSize) noexcept
{
    using ReallocFn = void* (*)(void*, size_t);
    static ReallocFn pfnRealloc = reinterpret_cast<ReallocFn>(dlsym(RTLD_NEXT, "realloc"));
    return IsRefused() ? nullptr : pfnRealloc(pMemory, uSize);
}

CMemoryFailure::CMemoryFailure(int iGranted)
{
    g_iGranted = iGranted;
    g_iFailures = 0;
    g_bActive = true;
}

CMemoryFailure::~CMemoryFailure()
{
    g_bActive = false;
}

int CMemoryFailure::Failures() const
{
    return g_iFailures;
}
