#include "bench/PeakMemory.h"

#include <cstdlib>
#include <malloc.h>

// The C library's own allocator, under which the counting one stands.
extern "C"
{
    void* __libc_malloc(size_t uSize);
    void* __libc_calloc(size_t uCount, size_t uSize);
    void* __libc_realloc(void* pBlock, size_t uSize);
    void __libc_free(void* pBlock);
}

namespace
{

// One thread measures; other threads of the benchmark library do not allocate meanwhile.
long long g_llHeld = 0;
long long g_llPeak = 0;
long long g_llStart = 0;

void* Count(void* pBlock)
{
    if (pBlock != nullptr)
    {
        g_llHeld += static_cast<long long>(malloc_usable_size(pBlock));
        g_llPeak = g_llHeld > g_llPeak ? g_llHeld : g_llPeak;
    }
    return pBlock;
}

void Discount(void* pBlock)
{
    if (pBlock != nullptr)
    {
        g_llHeld -= static_cast<long long>(malloc_usable_size(pBlock));
    }
}

} // namespace

extern "C"
{
    void* malloc(size_t uSize)
    {
        return Count(__libc_malloc(uSize));
    }
    void* calloc(size_t uCount, size_t uSize)
    {
        return Count(__libc_calloc(uCount, uSize));
    }
    void* realloc(void* pBlock, size_t uSize)
    {
        Discount(pBlock);
        void* pMoved = __libc_realloc(pBlock, uSize);
        Count(pMoved != nullptr ? pMoved : (uSize != 0 ? pBlock : nullptr));
        return pMoved;
    }
    void free(void* pBlock)
    {
        Discount(pBlock);
        __libc_free(pBlock);
    }
}

void CPeakMemory::Restart()
{
    g_llStart = g_llHeld;
    g_llPeak = g_llHeld;
}

size_t CPeakMemory::PeakBytes()
{
    return static_cast<size_t>(g_llPeak - g_llStart);
}
