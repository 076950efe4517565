#include "Filter/AccountFilterProcess.h"

#include "Filter/RecordIds.h"

int AccountFilterProcess::IsSameAccount(int iID, QVLong32* plList, int iNum)
{
    return IsInIdList(iID, plList, iNum) ? 1 : 0;
}

bool AccountFilterProcess::Keeps(const tag_ContactsStruct& record, const CFilter& filter,
                                 CFilterChain& /*chain*/)
{
    const CAccountFilter& account = static_cast<const CAccountFilter&>(filter);
    return IsInIdList(account.m_iID, record.lAccountID, CONTACT_MAX_ACCOUNTS);
}

int AccountFilterProcess::FilterRecord(tag_ContactsInfo* pInfo, CFilterChain& chain)
{
    return FilterByRule(pInfo, chain, KIND, Keeps);
}
