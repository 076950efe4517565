#include "LocalizerImpl/LowMapping.h"

#include "MemManager/Files/Descriptor.h"

#include <climits>
#include <fcntl.h>
#include <sys/mman.h>
#include <unistd.h>

namespace
{

constexpr uintptr_t PROCESSOR_LIMIT = static_cast<uintptr_t>(LONG_MAX) + 1;

// Programs and their heaps lie below the first hint as a rule. The last one stays below 2^31
// wherever addresses go further.
constexpr uintptr_t FIRST_HINT = 0x10000000;
constexpr uintptr_t LAST_HINT = 0x7F000000;
constexpr uintptr_t HINT_STEP = 0x01000000;

uintptr_t g_uLimit = PROCESSOR_LIMIT;

// A hint is a wish: where something is mapped already, the system chooses another address.
void* MapWithHint(int iFd, size_t uSize, uintptr_t uHint)
{
    void* pMap = mmap(reinterpret_cast<void*>(uHint), uSize, PROT_READ, MAP_PRIVATE, iFd, 0);
    if (pMap == MAP_FAILED || CLowMapping::IsHandle(pMap))
    {
        return pMap;
    }
    munmap(pMap, uSize);
    return MAP_FAILED;
}

} // namespace

bool CLowMapping::IsHandle(const void* pMap)
{
    return reinterpret_cast<uintptr_t>(pMap) < g_uLimit;
}

void* CLowMapping::Map(const char* szPath, size_t uSize)
{
    const CDescriptor file(OpenStoreFile(szPath, O_RDONLY));
    void* pMap = MAP_FAILED;
    for (uintptr_t uHint = FIRST_HINT;
         file.IsOpen() && pMap == MAP_FAILED && uHint <= LAST_HINT && uHint < g_uLimit;
         uHint += HINT_STEP)
    {
        pMap = MapWithHint(file.Get(), uSize, uHint);
    }
    return pMap;
}

void CLowMapping::SetLimit(uintptr_t uLimit)
{
    g_uLimit = uLimit != 0 ? uLimit : PROCESSOR_LIMIT;
}
