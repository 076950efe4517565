#ifndef QV_TESTS_FILTER_FILTERTESTSUPPORT_H
#define QV_TESTS_FILTER_FILTERTESTSUPPORT_H

#include <algorithm>
#include <memory>
#include <utility>
#include <vector>

#include "Core/ContactRecords.h"
#include "Filter/FilterChain.h"
#include "Filter/FilterChainBuilder.h"
#include "Filter/FilterProcess.h"

using IdList = std::vector<QVLong32>;
using KindAndId = std::pair<int, QVLong32>;
using Records = std::vector<tag_ContactsStruct>;

inline tag_ContactsStruct MakeContact(int iContactID, const IdList& vGroups,
                                      const IdList& vAccounts, uint32_t iFlags)
{
    tag_ContactsStruct record = {};
    record.iContactID = iContactID;
    std::copy(vGroups.begin(), vGroups.end(), record.lGroupID);
    std::copy(vAccounts.begin(), vAccounts.end(), record.lAccountID);
    record.iFlags = iFlags;
    return record;
}

inline std::unique_ptr<CFilterChain> MakeChain(const std::vector<KindAndId>& vFilters)
{
    std::vector<int> vKinds = {0}; // never empty, so that data() is not null
    IdList vIDs = {0};
    for (const KindAndId& filter : vFilters)
    {
        vKinds.insert(vKinds.end() - 1, filter.first);
        vIDs.insert(vIDs.end() - 1, filter.second);
    }
    CFilterChain* pChain = nullptr;
    BuildFilterChain(vKinds.data(), vIDs.data(), static_cast<int>(vFilters.size()), &pChain);
    return std::unique_ptr<CFilterChain>(pChain);
}

// Runs the process and all behind it over the records; those beyond the new count stay in the
// vector behind the kept ones. The new count is written to *piCount.
inline int RunPipeline(FilterProcess& process, CFilterChain& chain, Records& vRecords, int* piCount)
{
    tag_ContactsInfo info = {static_cast<int32_t>(vRecords.size()), vRecords.data()};
    const int iResult = process.FilterRecord(&info, chain);
    *piCount = info.RecordNum;
    return iResult;
}

#endif
