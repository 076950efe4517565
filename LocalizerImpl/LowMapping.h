#ifndef QV_LOCALIZERIMPL_LOWMAPPING_H
#define QV_LOCALIZERIMPL_LOWMAPPING_H

// Mappings whose address makes a handle. A handle is the address as a signed long and valid when
// it is positive; where pointers have 32 bits, half of all addresses are not, and systems prefer
// just that half for mappings.

#include <cstddef>
#include <cstdint>

class CLowMapping
{
public:
    // Whether the address of a mapping is a handle.
    static bool IsHandle(const void* pMap);

    // Maps the first uSize bytes of an existing file, which has at least as many, private and
    // read-only at an address that is a handle, never over another mapping. MAP_FAILED when the
    // file cannot be opened or no such address is free.
    static void* Map(const char* szPath, size_t uSize);

    // Lets only addresses below uLimit be handles; 0 brings back the limit of the processor. The
    // seam through which tests meet a system that maps high.
    static void SetLimit(uintptr_t uLimit);
};

#endif
