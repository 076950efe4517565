#include "Filter/MailFilterProcess.h"

bool MailFilterProcess::Keeps(const tag_ContactsStruct& record, const CFilter& /*filter*/,
                              CFilterChain& /*chain*/)
{
    return (record.iFlags & CONTACT_FLAG_MAIL) != 0;
}

int MailFilterProcess::FilterRecord(tag_ContactsInfo* pInfo, CFilterChain& chain)
{
    return FilterByRule(pInfo, chain, KIND, Keeps);
}
