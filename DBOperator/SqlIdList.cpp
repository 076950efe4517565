#include "DBOperator/SqlIdList.h"

#include <cstdint>
#include <cstdio>

CSqlIdList::CSqlIdList(long lCount, const long long* pIds) : m_szText{}, m_iLength(0), m_lWritten(0)
{
    if (!IsListed(lCount) || pIds == nullptr)
    {
        return;
    }
    Append(" in(", pIds[0]);
    while (m_lWritten < lCount && m_iLength < TEXT_LIMIT)
    {
        Append(",", pIds[m_lWritten]);
    }
    m_szText[m_iLength] = ')';
}

bool CSqlIdList::CanListAll(long lCount, const long long* pIds)
{
    return IsListed(lCount) && CSqlIdList(lCount, pIds).m_lWritten == lCount;
}

void CSqlIdList::Append(const char* szBefore, long long llId)
{
    const int iId = static_cast<int32_t>(static_cast<uint32_t>(llId));
    m_iLength += static_cast<size_t>(
        std::snprintf(m_szText + m_iLength, TEXT_SIZE - m_iLength, "%s%d", szBefore, iId));
    ++m_lWritten;
}
