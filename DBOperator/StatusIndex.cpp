#include "DBOperator/StatusIndex.h"

#include <algorithm>
#include <new>

namespace
{

constexpr int HASH_BITS = 32;
// The golden ratio in 32 bits: ids that follow each other spread over the whole table.
constexpr uint32_t HASH_FACTOR = 2654435769U;
// Keeps the size of the table within 31 bits, far above what fits into memory.
constexpr int MAX_INDEXED = 1 << 28;

int BitsFor(int iCount)
{
    int iBits = 1;
    while ((1 << iBits) < iCount * 2)
    {
        ++iBits;
    }
    return iBits;
}

} // namespace

CStatusIndex::CStatusIndex(tag_ContactsStruct* pContacts, int iCount)
    : m_pContacts(pContacts), m_iCount(iCount), m_iBits(0)
{
    if (iCount <= MAX_INDEXED)
    {
        m_iBits = BitsFor(iCount);
        m_pTable.reset(new (std::nothrow) int32_t[size_t{1} << m_iBits]());
    }
    if (m_pTable != nullptr)
    {
        MakeTable();
    }
}

tag_ContactsStruct* CStatusIndex::First(int iStatusId) const
{
    if (m_pTable == nullptr)
    {
        return Walk(iStatusId);
    }
    const int32_t iPlace = m_pTable[Slot(iStatusId)];
    return iPlace == 0 ? nullptr : m_pContacts + iPlace - 1;
}

void CStatusIndex::MakeTable()
{
    for (int i = 0; i < m_iCount; ++i)
    {
        int32_t& iPlace = m_pTable[Slot(m_pContacts[i].iStatusUpdateID)];
        if (iPlace == 0)
        {
            iPlace = i + 1;
        }
    }
}

// The slot that holds the id, or the free one where it would stand.
size_t CStatusIndex::Slot(int iStatusId) const
{
    const size_t iMask = (size_t{1} << m_iBits) - 1;
    size_t iSlot = (static_cast<uint32_t>(iStatusId) * HASH_FACTOR) >> (HASH_BITS - m_iBits);
    while (m_pTable[iSlot] != 0 && m_pContacts[m_pTable[iSlot] - 1].iStatusUpdateID != iStatusId)
    {
        iSlot = (iSlot + 1) & iMask;
    }
    return iSlot;
}

tag_ContactsStruct* CStatusIndex::Walk(int iStatusId) const
{
    tag_ContactsStruct* pEnd = m_pContacts + m_iCount;
    tag_ContactsStruct* pFound = std::find_if(m_pContacts, pEnd,
                                              [iStatusId](const tag_ContactsStruct& contact)
                                              { return contact.iStatusUpdateID == iStatusId; });
    return pFound == pEnd ? nullptr : pFound;
}
