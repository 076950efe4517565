#include "Filter/GroupFilterProcess.h"

#include "Filter/RecordIds.h"

int GroupFilterProcess::IsSameGroup(int iID, QVLong32* plList, int iNum)
{
    return IsInIdList(iID, plList, iNum) ? 1 : 0;
}

bool GroupFilterProcess::Keeps(const tag_ContactsStruct& record, const CFilter& filter,
                               CFilterChain& /*chain*/)
{
    const CGroupFilter& group = static_cast<const CGroupFilter&>(filter);
    return IsInIdList(group.m_iID, record.lGroupID, CONTACT_MAX_GROUPS);
}

int GroupFilterProcess::FilterRecord(tag_ContactsInfo* pInfo, CFilterChain& chain)
{
    return FilterByRule(pInfo, chain, KIND, Keeps);
}
