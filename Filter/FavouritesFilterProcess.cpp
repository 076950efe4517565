#include "Filter/FavouritesFilterProcess.h"

int FavouritesFilterProcess::FilterRecord(tag_ContactsInfo* pInfo, CFilterChain& chain)
{
    return FilterByRule(pInfo, chain, KIND, Keeps);
}
