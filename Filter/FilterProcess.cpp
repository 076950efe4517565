#include "Filter/FilterProcess.h"

#include <memory>
#include <new>

#include "Filter/FilterChain.h"

namespace
{

// A rule with the filter and the chain that it is asked about.
struct tag_RuleInUse
{
    RecordRuleFn pfnKeeps;
    const CFilter& filter;
    CFilterChain& chain;

    bool Keeps(const tag_ContactsStruct& record) const { return pfnKeeps(record, filter, chain); }
};

void MoveRecord(tag_ContactsStruct* pRecords, int iFrom, int iTo)
{
    if (iFrom != iTo)
    {
        pRecords[iTo] = pRecords[iFrom];
    }
}

// Writes the indices of the kept records to piKept, in order; their number.
int CollectKept(const tag_ContactsInfo& info, const tag_RuleInUse& rule, int* piKept)
{
    int iKept = 0;
    for (int i = 0; i < info.RecordNum; ++i)
    {
        if (rule.Keeps(info.pContacts[i]))
        {
            piKept[iKept++] = i;
        }
    }
    return iKept;
}

// Tests and moves record by record, without memory of its own; the number of kept records.
int MoveKeptAtOnce(const tag_ContactsInfo& info, const tag_RuleInUse& rule)
{
    int iKept = 0;
    for (int i = 0; i < info.RecordNum; ++i)
    {
        if (rule.Keeps(info.pContacts[i]))
        {
            MoveRecord(info.pContacts, i, iKept++);
        }
    }
    return iKept;
}

// Brings the kept records to the front; their number.
int MoveKept(const tag_ContactsInfo& info, const tag_RuleInUse& rule)
{
    if (info.pContacts == nullptr || info.RecordNum <= 0)
    {
        return 0;
    }
    const std::unique_ptr<int[]> piKept(
        new (std::nothrow) int[static_cast<size_t>(info.RecordNum)]());
    if (piKept == nullptr)
    {
        return MoveKeptAtOnce(info, rule);
    }
    const int iKept = CollectKept(info, rule, piKept.get());
    for (int j = 0; j < iKept; ++j)
    {
        MoveRecord(info.pContacts, piKept[static_cast<size_t>(j)], j);
    }
    return iKept;
}

} // namespace

FilterProcess::~FilterProcess()
{
    // Each process is cut from the pipeline before it goes, so that none deletes the rest.
    while (m_pNext != nullptr)
    {
        FilterProcess* pGone = m_pNext;
        m_pNext = pGone->m_pNext;
        pGone->m_pNext = nullptr;
        delete pGone;
    }
}

int FilterProcess::FilterByRule(tag_ContactsInfo* pInfo, CFilterChain& chain, int iKind,
                                RecordRuleFn pfnKeeps)
{
    if (pInfo == nullptr)
    {
        return -1;
    }
    for (int k = 0; k < chain.GetFilterNum(); ++k)
    {
        const CFilter* pFilter = chain.GetFilterByNo(k);
        if (pFilter != nullptr && pFilter->m_iType == iKind)
        {
            pInfo->RecordNum = MoveKept(*pInfo, {pfnKeeps, *pFilter, chain});
        }
    }
    return m_pNext != nullptr ? m_pNext->FilterRecord(pInfo, chain) : 0;
}
