#include "Filter/FavouritesFilterProcess.h"

bool FavouritesFilterProcess::Keeps(const tag_ContactsStruct& record, const CFilter& /*filter*/,
                                    CFilterChain& /*chain*/)
{
    return (record.iFlags & CONTACT_FLAG_STARRED) != 0;
}

int FavouritesFilterProcess::FilterRecord(tag_ContactsInfo* pInfo, CFilterChain& chain)
{
    return FilterByRule(pInfo, chain, KIND, Keeps);
}
