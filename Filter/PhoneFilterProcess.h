#ifndef QV_FILTER_PHONEFILTERPROCESS_H
#define QV_FILTER_PHONEFILTERPROCESS_H

#include "Filter/Filter.h"
#include "Filter/FilterProcess.h"

// Keeps the contacts that have a phone number.
class QV_EXPORT PhoneFilterProcess : public FilterProcess
{
public:
    // The kind of filter served, and its rule.
    static constexpr int KIND = FILTER_PHONE;
    QV_INTERNAL static bool Keeps(const tag_ContactsStruct& record, const CFilter& filter,
                                  CFilterChain& chain);

    int FilterRecord(tag_ContactsInfo* pInfo, CFilterChain& chain) override;
};

#endif
