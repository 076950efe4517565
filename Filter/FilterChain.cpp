#include "Filter/FilterChain.h"

#include <cstddef>

CFilterChain::CFilterChain() = default;

CFilterChain::~CFilterChain()
{
    for (size_t uIndex = 0; uIndex < m_vFilters.size(); ++uIndex)
    {
        delete m_vFilters[uIndex];
        m_vFilters.replaceAt(nullptr, uIndex);
    }
}

void CFilterChain::SetFilter(CFilter* pFilter)
{
    if (m_vFilters.add(pFilter) < 0)
    {
        delete pFilter;
    }
}

int CFilterChain::GetFilterNum()
{
    return static_cast<int>(m_vFilters.size());
}

CFilter* CFilterChain::GetFilterByNo(int iNo)
{
    // As an unsigned number a negative index is above every valid one.
    const size_t uIndex = static_cast<unsigned int>(iNo);
    return uIndex < m_vFilters.size() ? m_vFilters[uIndex] : nullptr;
}
