#ifndef QV_FILTER_ACCOUNTEXPANDFILTERPROCESS_H
#define QV_FILTER_ACCOUNTEXPANDFILTERPROCESS_H

#include "Filter/Filter.h"
#include "Filter/FilterProcess.h"

// Removes the contacts that lie wholly inside the accounts excluded by the chain's filters of this
// kind. A contact without accounts stays.
class QV_EXPORT AccountExpandFilterProcess : public FilterProcess
{
public:
    // The kind of filter served, and its rule.
    static constexpr int KIND = FILTER_ACCOUNT_EXPAND;
    QV_INTERNAL static bool Keeps(const tag_ContactsStruct& record, const CFilter& filter,
                                  CFilterChain& chain);

    // 1 when a contact with the accounts at plList (at most iNum, ending at the first 0) is to go:
    // its one account is iID, or it has several and each is the id of a filter of this kind in the
    // chain. Else 0. Unless there is exactly one account, their number is logged. Reads
    // list and chain only and allocates nothing.
    int IsSameAccountEx(int iID, QVLong32* plList, int iNum, CFilterChain& chain);

    int FilterRecord(tag_ContactsInfo* pInfo, CFilterChain& chain) override;
};

#endif
