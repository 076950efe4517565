#include "Filter/PhoneFilterProcess.h"

bool PhoneFilterProcess::Keeps(const tag_ContactsStruct& record, const CFilter& /*filter*/,
                               CFilterChain& /*chain*/)
{
    return (record.iFlags & CONTACT_FLAG_PHONE) != 0;
}

int PhoneFilterProcess::FilterRecord(tag_ContactsInfo* pInfo, CFilterChain& chain)
{
    return FilterByRule(pInfo, chain, KIND, Keeps);
}
