#ifndef QV_FILTER_FILTERPROCESS_H
#define QV_FILTER_FILTERPROCESS_H

#include "Common/Export.h"
#include "Core/Records/ContactRecords.h"

class CFilter;
class CFilterChain;

// Whether a record passes a filter, which is of the class of the rule's kind; chain is the chain
// that contains it.
using RecordRuleFn = bool (*)(const tag_ContactsStruct& record, const CFilter& filter,
                              CFilterChain& chain);

// The rule of the kinds that test a flag of the record.
template <uint32_t FLAG>
bool HasFlag(const tag_ContactsStruct& record, const CFilter& /*filter*/, CFilterChain& /*chain*/)
{
    return (record.iFlags & FLAG) != 0;
}

// One step of the pipeline that narrows a set of records by a chain of filters. Each subclass
// applies the filters of one kind and states two things: that kind (KIND) and its rule (Keeps).
// The caller owns records and chain. No lock is taken.
class QV_EXPORT FilterProcess
{
public:
    FilterProcess() = default;
    // Deletes all following processes too, iteratively: the stack does not grow with their number.
    virtual ~FilterProcess();
    FilterProcess(const FilterProcess&) = delete;
    FilterProcess& operator=(const FilterProcess&) = delete;

    // Narrows the set once for each filter of this kind in the chain: the kept records move to the
    // front in their order and RecordNum becomes their number; the array is not shrunk. Filters of
    // other kinds and null ones are skipped. Then runs the next process and returns its result; the
    // last one returns 0. A null pInfo returns -1 with no further process run. Nothing else fails.
    virtual int FilterRecord(tag_ContactsInfo* pInfo, CFilterChain& chain) = 0;

    FilterProcess* m_pNext = nullptr; // owned; null in the last process

protected:
    // The body of every FilterRecord.
    QV_INTERNAL int FilterByRule(tag_ContactsInfo* pInfo, CFilterChain& chain, int iKind,
                                 RecordRuleFn pfnKeeps);
};
static_assert(sizeof(void*) != 4 || sizeof(FilterProcess) == 8, "part of the interface");

#endif
