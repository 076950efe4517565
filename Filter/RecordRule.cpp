#include "Filter/RecordRule.h"

#include "Filter/Filter.h"
#include "Filter/FilterChain.h"
#include "Filter/FilterKinds.h"

bool CRecordRule::CanTest(CFilterChain& chain)
{
    for (int k = 0; k < chain.GetFilterNum(); ++k)
    {
        const CFilter* pFilter = chain.GetFilterByNo(k);
        const tag_FilterKind* pKind =
            pFilter != nullptr ? FindFilterKind(pFilter->m_iType) : nullptr;
        if (pFilter != nullptr && (pKind == nullptr || pKind->bLogs))
        {
            return false;
        }
    }
    return true;
}

bool CRecordRule::Keeps(const tag_ContactsStruct& record) const
{
    for (int k = 0; k < m_chain.GetFilterNum(); ++k)
    {
        const CFilter* pFilter = m_chain.GetFilterByNo(k);
        const tag_FilterKind* pKind =
            pFilter != nullptr ? FindFilterKind(pFilter->m_iType) : nullptr;
        if (pKind != nullptr && !pKind->pfnKeeps(record, *pFilter, m_chain))
        {
            return false;
        }
    }
    return true;
}
