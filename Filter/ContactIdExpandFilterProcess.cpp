#include "Filter/ContactIdExpandFilterProcess.h"

bool ContactIdExpandFilterProcess::Keeps(const tag_ContactsStruct& record, const CFilter& filter,
                                         CFilterChain& /*chain*/)
{
    const CContactIdExpandFilter& contact = static_cast<const CContactIdExpandFilter&>(filter);
    return record.iContactID != contact.m_iID;
}

int ContactIdExpandFilterProcess::FilterRecord(tag_ContactsInfo* pInfo, CFilterChain& chain)
{
    return FilterByRule(pInfo, chain, KIND, Keeps);
}
