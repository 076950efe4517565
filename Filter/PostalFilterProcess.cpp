#include "Filter/PostalFilterProcess.h"

bool PostalFilterProcess::Keeps(const tag_ContactsStruct& record, const CFilter& /*filter*/,
                                CFilterChain& /*chain*/)
{
    return (record.iFlags & CONTACT_FLAG_ADDRESS) != 0;
}

int PostalFilterProcess::FilterRecord(tag_ContactsInfo* pInfo, CFilterChain& chain)
{
    return FilterByRule(pInfo, chain, KIND, Keeps);
}
