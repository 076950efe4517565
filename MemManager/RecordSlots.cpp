#include "MemManager/RecordSlots.h"

#include <algorithm>
#include <cstdint>
#include <cstring>
#include <sys/mman.h>
#include <unistd.h>

namespace
{

constexpr size_t MIN_PREPARED = 65536; // bytes; for fewer, a few page faults are cheaper

constexpr size_t BODY_OFFSET = offsetof(tag_ContactsStruct, lGroupID);
constexpr size_t BODY_SIZE = sizeof(tag_ContactsStruct) - BODY_OFFSET;
static_assert(offsetof(tag_ContactsStruct, iContactID) == 0 && BODY_OFFSET == sizeof(int32_t),
              "the id comes first, the body is the rest");

char* Body(tag_ContactsStruct* pRecord)
{
    return reinterpret_cast<char*>(pRecord) + BODY_OFFSET;
}

const char* Body(const tag_ContactsStruct* pRecord)
{
    return reinterpret_cast<const char*>(pRecord) + BODY_OFFSET;
}

// Clears the contact id before the body changes.
void BeginSlot(tag_ContactsStruct* pSlot)
{
    __atomic_store_n(&pSlot->iContactID, 0, __ATOMIC_RELAXED);
    __atomic_thread_fence(__ATOMIC_RELEASE);
}

// Sets the contact id after the body.
void EndSlot(tag_ContactsStruct* pSlot, int32_t iContactID)
{
    __atomic_store_n(&pSlot->iContactID, iContactID, __ATOMIC_RELEASE);
}

// First to last.
void MoveUpward(tag_ContactsStruct* pSlots, int iFrom, int iTo, int iCount)
{
    for (int i = 0; i < iCount; ++i)
    {
        WriteSlot(pSlots + iTo + i, pSlots + iFrom + i);
    }
}

} // namespace

void WriteSlot(tag_ContactsStruct* pSlot, const tag_ContactsStruct* pRecord)
{
    const int32_t iContactID = pRecord->iContactID;
    BeginSlot(pSlot);
    std::memcpy(Body(pSlot), Body(pRecord), BODY_SIZE);
    EndSlot(pSlot, iContactID);
}

void MoveSlots(tag_ContactsStruct* pSlots, int iFrom, int iTo, int iCount)
{
    if (iTo <= iFrom)
    {
        MoveUpward(pSlots, iFrom, iTo, iTo < iFrom ? iCount : 0);
        return;
    }
    // Each record is read before its slot is overwritten: the last ones go first. Blocks as long
    // as the distance do not overlap and are copied upward, which is faster.
    const int iBlock = iTo - iFrom;
    for (int iLeft = iCount; iLeft > 0; iLeft -= iBlock)
    {
        const int iStart = std::max(iLeft - iBlock, 0);
        MoveUpward(pSlots, iFrom + iStart, iTo + iStart, iLeft - iStart);
    }
}

// Making a page writable that was only read is slower than mapping it writable, so the pages are
// dropped first. The first page shows whether the system supports it at all.
void PrepareSlots(tag_ContactsStruct* pSlots, int iFirst, int iEnd)
{
#ifdef MADV_POPULATE_WRITE
    const auto uPage = static_cast<uintptr_t>(sysconf(_SC_PAGESIZE));
    const uintptr_t uStart = reinterpret_cast<uintptr_t>(pSlots + iFirst) / uPage * uPage;
    const size_t uSize = reinterpret_cast<uintptr_t>(pSlots + iEnd) - uStart;
    void* pStart = reinterpret_cast<void*>(uStart);
    if (uSize >= MIN_PREPARED && madvise(pStart, uPage, MADV_POPULATE_WRITE) == 0 &&
        madvise(pStart, uSize, MADV_DONTNEED) == 0)
    {
        madvise(pStart, uSize, MADV_POPULATE_WRITE);
    }
#else
    (void)pSlots;
    (void)iFirst;
    (void)iEnd;
#endif
}

void ClearSlots(tag_ContactsStruct* pSlots, int iCount)
{
    for (int i = 0; i < iCount; ++i)
    {
        BeginSlot(pSlots + i);
        std::memset(Body(pSlots + i), 0, BODY_SIZE);
    }
}
