#ifndef QV_FILTER_MAILFILTERPROCESS_H
#define QV_FILTER_MAILFILTERPROCESS_H

#include "Filter/Filter.h"
#include "Filter/FilterProcess.h"

// Keeps the contacts that have a mail address.
class QV_EXPORT MailFilterProcess : public FilterProcess
{
public:
    // The kind of filter served, and its rule.
    static constexpr int KIND = FILTER_MAIL;
    static constexpr RecordRuleFn Keeps = HasFlag<CONTACT_FLAG_MAIL>;

    int FilterRecord(tag_ContactsInfo* pInfo, CFilterChain& chain) override;
};

#endif
