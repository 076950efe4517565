#ifndef QV_FILTER_ONLINEFILTERPROCESS_H
#define QV_FILTER_ONLINEFILTERPROCESS_H

#include "Filter/Filter.h"
#include "Filter/FilterProcess.h"

// Keeps the contacts that are online and logs one line for each.
class QV_EXPORT OnlineFilterProcess : public FilterProcess
{
public:
    // The kind of filter served, and its rule.
    static constexpr int KIND = FILTER_ONLINE;
    QV_INTERNAL static bool Keeps(const tag_ContactsStruct& record, const CFilter& filter,
                                  CFilterChain& chain);

    int FilterRecord(tag_ContactsInfo* pInfo, CFilterChain& chain) override;
};

#endif
