#ifndef QV_FILTER_GROUPEXPANDFILTERPROCESS_H
#define QV_FILTER_GROUPEXPANDFILTERPROCESS_H

#include "Filter/Filter.h"
#include "Filter/FilterProcess.h"

// Removes the members of the filter's group.
class QV_EXPORT GroupExpandFilterProcess : public FilterProcess
{
public:
    // The kind of filter served, and its rule.
    static constexpr int KIND = FILTER_GROUP_EXPAND;
    QV_INTERNAL static bool Keeps(const tag_ContactsStruct& record, const CFilter& filter,
                                  CFilterChain& chain);

    int FilterRecord(tag_ContactsInfo* pInfo, CFilterChain& chain) override;
};

#endif
