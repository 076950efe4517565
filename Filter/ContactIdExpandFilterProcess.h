#ifndef QV_FILTER_CONTACTIDEXPANDFILTERPROCESS_H
#define QV_FILTER_CONTACTIDEXPANDFILTERPROCESS_H

#include "Filter/Filter.h"
#include "Filter/FilterProcess.h"

// Removes the contact with the filter's id.
class QV_EXPORT ContactIdExpandFilterProcess : public FilterProcess
{
public:
    // The kind of filter served, and its rule.
    static constexpr int KIND = FILTER_CONTACT_ID_EXPAND;
    QV_INTERNAL static bool Keeps(const tag_ContactsStruct& record, const CFilter& filter,
                                  CFilterChain& chain);

    int FilterRecord(tag_ContactsInfo* pInfo, CFilterChain& chain) override;
};

#endif
