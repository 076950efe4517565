#include "Filter/GroupFilterProcess.h"

#include "Filter/IdList.h"

int GroupFilterProcess::IsSameGroup(int iID, const QVLong32* plList, int iNum)
{
    return IsInIdList(iID, plList, iNum) ? 1 : 0;
}

bool GroupFilterProcess::Keeps(const tag_ContactsStruct& record, const CFilter& filter,
                               const CFilterChain& /*chain*/)
{
    const CGroupFilter& group = static_cast<const CGroupFilter&>(filter);
    return IsSameGroup(group.GetGroupID(), record.lGroupID, CONTACT_MAX_GROUPS) == 1;
}

int GroupFilterProcess::FilterRecord(tag_ContactsInfo* pInfo, CFilterChain& chain)
{
    return FilterByRule(pInfo, chain, KIND, Keeps);
}
