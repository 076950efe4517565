#include "Filter/GroupExpandFilterProcess.h"

#include "Filter/RecordIds.h"

bool GroupExpandFilterProcess::Keeps(const tag_ContactsStruct& record, const CFilter& filter,
                                     CFilterChain& /*chain*/)
{
    const CGroupExpandFilter& group = static_cast<const CGroupExpandFilter&>(filter);
    return !IsInIdList(group.m_iID, record.lGroupID, CONTACT_MAX_GROUPS);
}

int GroupExpandFilterProcess::FilterRecord(tag_ContactsInfo* pInfo, CFilterChain& chain)
{
    return FilterByRule(pInfo, chain, KIND, Keeps);
}
