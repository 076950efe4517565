#include "DBOperator/StatusIndex.h"

#include <algorithm>
#include <new>

CStatusIndex::CStatusIndex(tag_ContactsStruct* pContacts, int iCount)
    : m_pContacts(pContacts), m_iCount(iCount),
      m_pSorted(new (std::nothrow) IdAndPlace[static_cast<size_t>(iCount)])
{
    for (int i = 0; m_pSorted != nullptr && i < iCount; ++i)
    {
        m_pSorted[static_cast<size_t>(i)] = {pContacts[i].iStatusUpdateID, i};
    }
    if (m_pSorted != nullptr)
    {
        std::sort(m_pSorted.get(), m_pSorted.get() + iCount);
    }
}

tag_ContactsStruct* CStatusIndex::First(int iStatusId) const
{
    if (m_pSorted == nullptr)
    {
        return Walk(iStatusId);
    }
    const IdAndPlace* pBegin = m_pSorted.get();
    const IdAndPlace* pEnd = pBegin + m_iCount;
    const IdAndPlace* pFound = std::lower_bound(pBegin, pEnd, IdAndPlace(iStatusId, 0));
    return pFound != pEnd && pFound->first == iStatusId ? m_pContacts + pFound->second : nullptr;
}

tag_ContactsStruct* CStatusIndex::Walk(int iStatusId) const
{
    tag_ContactsStruct* pEnd = m_pContacts + m_iCount;
    tag_ContactsStruct* pFound = std::find_if(m_pContacts, pEnd,
                                              [iStatusId](const tag_ContactsStruct& contact)
                                              { return contact.iStatusUpdateID == iStatusId; });
    return pFound == pEnd ? nullptr : pFound;
}
