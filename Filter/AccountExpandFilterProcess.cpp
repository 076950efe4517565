#include "Filter/AccountExpandFilterProcess.h"

#include "Common/Log.h"
#include "Filter/FilterChain.h"
#include "Filter/RecordIds.h"

namespace
{

constexpr const char* TRACE_TAG = "Filter/AccountExpandFilterProcess";

// Searches the chain itself: it is as short as a list of its ids and needs no allocation.
bool IsExcluded(QVLong32 lAccountID, CFilterChain& chain)
{
    for (int k = 0; k < chain.GetFilterNum(); ++k)
    {
        const CFilter* pFilter = chain.GetFilterByNo(k);
        if (pFilter != nullptr && pFilter->m_iType == FILTER_ACCOUNT_EXPAND &&
            static_cast<const CAccountExpandFilter*>(pFilter)->m_iID == lAccountID)
        {
            return true;
        }
    }
    return false;
}

bool AreAllExcluded(const QVLong32* plAccounts, int iCount, CFilterChain& chain)
{
    for (int i = 0; i < iCount; ++i)
    {
        if (!IsExcluded(plAccounts[i], chain))
        {
            return false;
        }
    }
    return iCount > 0;
}

bool IsConfined(int iID, const QVLong32* plList, int iNum, CFilterChain& chain)
{
    const int iCount = CountIds(plList, iNum);
    if (iCount == 1)
    {
        return plList[0] == iID;
    }
    QV_LOGD(TRACE_TAG, "QV_Contacts: IsSameAccountEx ACCOUNT SUM= %d\n", iCount);
    return AreAllExcluded(plList, iCount, chain);
}

} // namespace

int AccountExpandFilterProcess::IsSameAccountEx(int iID, QVLong32* plList, int iNum,
                                                CFilterChain& chain)
{
    return IsConfined(iID, plList, iNum, chain) ? 1 : 0;
}

bool AccountExpandFilterProcess::Keeps(const tag_ContactsStruct& record, const CFilter& filter,
                                       CFilterChain& chain)
{
    const CAccountExpandFilter& account = static_cast<const CAccountExpandFilter&>(filter);
    return !IsConfined(account.m_iID, record.lAccountID, CONTACT_MAX_ACCOUNTS, chain);
}

int AccountExpandFilterProcess::FilterRecord(tag_ContactsInfo* pInfo, CFilterChain& chain)
{
    return FilterByRule(pInfo, chain, KIND, Keeps);
}
