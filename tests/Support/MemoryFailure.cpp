#include "tests/Support/MemoryFailure.h"

#include <climits>
#include <cstddef>
#include <dlfcn.h>
#include <new>

namespace
{

constexpr int ALL = INT_MAX;

int g_iGranted = ALL;

bool IsRefused()
{
    return g_iGranted != ALL && --g_iGranted < 0;
}

} // namespace

void* operator new(size_t uSize, const std::nothrow_t& /*tag*/) noexcept
{
    return IsRefused() ? nullptr : ::operator new(uSize);
}

void* operator new[](size_t uSize, const std::nothrow_t& /*tag*/) noexcept
{
    return IsRefused() ? nullptr : ::operator new[](uSize);
}

// Takes the C library's place in the test program and hands on to it.
extern "C" void* realloc(void* pMemory, size_t uSize) noexcept
{
    static const auto pfnRealloc =
        reinterpret_cast<decltype(&realloc)>(dlsym(RTLD_NEXT, "realloc"));
    return IsRefused() ? nullptr : pfnRealloc(pMemory, uSize);
}

CMemoryFailure::CMemoryFailure(int iGranted)
{
    g_iGranted = iGranted;
}

CMemoryFailure::~CMemoryFailure()
{
    g_iGranted = ALL;
}
