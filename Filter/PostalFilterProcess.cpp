#include "Filter/PostalFilterProcess.h"

int PostalFilterProcess::FilterRecord(tag_ContactsInfo* pInfo, CFilterChain& chain)
{
    return FilterByRule(pInfo, chain, KIND, Keeps);
}
