#include "Filter/FilterProcess.h"

#include "Filter/FilterChain.h"

namespace
{

// Moves the kept records to the front and returns their number.
int MoveKept(const tag_ContactsInfo& info, const CFilter& filter, CFilterChain& chain,
             RecordRuleFn pfnKeeps)
{
    tag_ContactsStruct* pRecords = info.pContacts;
    int iKept = 0;
    for (int i = 0; pRecords != nullptr && i < info.RecordNum; ++i)
    {
        if (!pfnKeeps(pRecords[i], filter, chain))
        {
            continue;
        }
        if (i != iKept)
        {
            pRecords[iKept] = pRecords[i];
        }
        ++iKept;
    }
    return iKept;
}

} // namespace

FilterProcess::~FilterProcess()
{
    // Each process is unlinked before it is deleted, so that none deletes the rest.
    while (m_pNext != nullptr)
    {
        FilterProcess* pGone = m_pNext;
        m_pNext = pGone->m_pNext;
        pGone->m_pNext = nullptr;
        delete pGone;
    }
}

int FilterProcess::FilterByRule(tag_ContactsInfo* pInfo, CFilterChain& chain, int iKind,
                                RecordRuleFn pfnKeeps)
{
    if (pInfo == nullptr)
    {
        return -1;
    }
    for (int k = 0; k < chain.GetFilterNum(); ++k)
    {
        const CFilter* pFilter = chain.GetFilterByNo(k);
        if (pFilter != nullptr && pFilter->m_iType == iKind)
        {
            pInfo->RecordNum = MoveKept(*pInfo, *pFilter, chain, pfnKeeps);
        }
    }
    return m_pNext != nullptr ? m_pNext->FilterRecord(pInfo, chain) : 0;
}
