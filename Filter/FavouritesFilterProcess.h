#ifndef QV_FILTER_FAVOURITESFILTERPROCESS_H
#define QV_FILTER_FAVOURITESFILTERPROCESS_H

#include "Filter/Filter.h"
#include "Filter/FilterProcess.h"

// Keeps the starred contacts.
class QV_EXPORT FavouritesFilterProcess : public FilterProcess
{
public:
    // The kind of filter served, and its rule.
    static constexpr int KIND = FILTER_FAVOURITES;
    static constexpr RecordRuleFn Keeps = HasFlag<CONTACT_FLAG_STARRED>;

    int FilterRecord(tag_ContactsInfo* pInfo, CFilterChain& chain) override;
};

#endif
