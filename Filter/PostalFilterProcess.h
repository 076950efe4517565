#ifndef QV_FILTER_POSTALFILTERPROCESS_H
#define QV_FILTER_POSTALFILTERPROCESS_H

#include "Filter/Filter.h"
#include "Filter/FilterProcess.h"

// Keeps the contacts that have a postal address.
class QV_EXPORT PostalFilterProcess : public FilterProcess
{
public:
    // The kind of filter served, and its rule.
    static constexpr int KIND = FILTER_POSTAL;
    static constexpr RecordRuleFn Keeps = HasFlag<CONTACT_FLAG_ADDRESS>;

    int FilterRecord(tag_ContactsInfo* pInfo, CFilterChain& chain) override;
};

#endif
