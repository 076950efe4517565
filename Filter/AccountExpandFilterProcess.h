#ifndef QV_FILTER_ACCOUNTEXPANDFILTERPROCESS_H
#define QV_FILTER_ACCOUNTEXPANDFILTERPROCESS_H

#include "Filter/Filter.h"
#include "Filter/FilterProcess.h"

// Removes the contacts all of whose accounts are excluded by the chain's filters of this kind. A
// contact without accounts stays.
class QV_EXPORT AccountExpandFilterProcess : public FilterProcess
{
public:
    // The kind of filter served, and its rule.
    static constexpr int KIND = FILTER_ACCOUNT_EXPAND;
    QV_INTERNAL static bool Keeps(const tag_ContactsStruct& record, const CFilter& filter,
                                  CFilterChain& chain);

    int FilterRecord(tag_ContactsInfo* pInfo, CFilterChain& chain) override;

    // --- For callers outside: nothing in the library calls this ---

    // 1 if a contact with the accounts at plList (at most iNum, ending at the first 0) is removed:
    // its one account is iID, or it has several and each is the id of a filter of this kind in the
    // chain. Else 0. Logs the number of accounts unless it is 1. Only reads list and chain.
    int IsSameAccountEx(int iID, QVLong32* plList, int iNum, CFilterChain& chain);
};

#endif
