#include "Filter/GroupExpandFilterProcess.h"

#include "Filter/AccountFilterProcess.h"

bool GroupExpandFilterProcess::Keeps(const tag_ContactsStruct& record, const CFilter& filter,
                                     const CFilterChain& /*chain*/)
{
    const CGroupExpandFilter& group = static_cast<const CGroupExpandFilter&>(filter);
    return AccountFilterProcess::IsSameAccount(group.GetGroupID(), record.lGroupID,
                                               CONTACT_MAX_GROUPS) == 0;
}

int GroupExpandFilterProcess::FilterRecord(tag_ContactsInfo* pInfo, CFilterChain& chain)
{
    return FilterByRule(pInfo, chain, KIND, Keeps);
}
