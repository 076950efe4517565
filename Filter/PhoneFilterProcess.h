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
    static constexpr RecordRuleFn Keeps = HasFlag<CONTACT_FLAG_PHONE>;

    int FilterRecord(tag_ContactsInfo* pInfo, CFilterChain& chain) override;
};

#endif
