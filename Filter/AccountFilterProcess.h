#ifndef QV_FILTER_ACCOUNTFILTERPROCESS_H
#define QV_FILTER_ACCOUNTFILTERPROCESS_H

#include "Filter/Filter.h"
#include "Filter/FilterProcess.h"

// Keeps the contacts that have data in the filter's account.
class QV_EXPORT AccountFilterProcess : public FilterProcess
{
public:
    // The kind of filter served, and its rule.
    static constexpr int KIND = FILTER_ACCOUNT;
    QV_INTERNAL static bool Keeps(const tag_ContactsStruct& record, const CFilter& filter,
                                  CFilterChain& chain);

    int FilterRecord(tag_ContactsInfo* pInfo, CFilterChain& chain) override;

    // --- For callers outside: nothing in the library calls this ---

    // 1 if iID is among the iNum accounts at plList, else 0. The list ends at its first 0, which is
    // compared too: id 0 matches every list that has a 0. The list is only read.
    int IsSameAccount(int iID, QVLong32* plList, int iNum);
};

#endif
