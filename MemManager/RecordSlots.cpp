#include "MemManager/RecordSlots.h"

#include <cstring>

namespace
{

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

// The slot stands without a contact before its body changes.
void BeginSlot(tag_ContactsStruct* pSlot)
{
    __atomic_store_n(&pSlot->iContactID, 0, __ATOMIC_RELAXED);
    __atomic_thread_fence(__ATOMIC_RELEASE);
}

// The contact id appears after its body.
void EndSlot(tag_ContactsStruct* pSlot, int32_t iContactID)
{
    __atomic_store_n(&pSlot->iContactID, iContactID, __ATOMIC_RELEASE);
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
    if (iTo == iFrom)
    {
        return;
    }
    for (int i = 0; i < iCount; ++i)
    {
        // Each record is read before its slot is written.
        const int iRecord = iTo < iFrom ? i : iCount - 1 - i;
        WriteSlot(pSlots + iTo + iRecord, pSlots + iFrom + iRecord);
    }
}

void ClearSlots(tag_ContactsStruct* pSlots, int iCount)
{
    for (int i = 0; i < iCount; ++i)
    {
        BeginSlot(pSlots + i);
        std::memset(Body(pSlots + i), 0, BODY_SIZE);
    }
}
