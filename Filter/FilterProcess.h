#ifndef QV_FILTER_FILTERPROCESS_H
#define QV_FILTER_FILTERPROCESS_H

#include "Common/Export.h"
#include "Core/Records/ContactRecords.h"

class CFilter;
class CFilterChain;

// Whether a filter lets a record pass. The filter is of the class that belongs to the rule's
// kind; chain is the one it stands in.
using RecordRuleFn = bool (*)(const tag_ContactsStruct& record, const CFilter& filter,
                              CFilterChain& chain);

// The rule of the kinds that ask for a flag of the record.
template <uint32_t FLAG>
bool HasFlag(const tag_ContactsStruct& record, const CFilter& /*filter*/, CFilterChain& /*chain*/)
{
    return (record.iFlags & FLAG) != 0;
}

// One step of the pipeline that narrows a set of records by a chain of filters. Each subclass
// serves the filters of one kind and states two things: that kind (KIND) and its rule (Keeps).
// Records and chain belong to the caller, no lock is taken.
class QV_EXPORT FilterProcess
{
public:
    FilterProcess() = default;
    // Deletes all following processes too; the stack it uses does not grow with their number.
    virtual ~FilterProcess();
    FilterProcess(const FilterProcess&) = delete;
    FilterProcess& operator=(const FilterProcess&) = delete;

    // Narrows the set once for each filter of this kind in the chain: the kept records move to the
    // front in their order and RecordNum becomes their number, 0 when none is left; the array is
    // not shrunk and what lies behind stays. Filters of other kinds and null ones are skipped.
    // Then runs the next process and returns its result; the last one returns 0. A null pInfo
    // returns -1 with no further process run. Nothing else fails.
    virtual int FilterRecord(tag_ContactsInfo* pInfo, CFilterChain& chain) = 0;

    FilterProcess* m_pNext = nullptr; // owned; null in the last process

protected:
    // The body of every FilterRecord.
    QV_INTERNAL int FilterByRule(tag_ContactsInfo* pInfo, CFilterChain& chain, int iKind,
                                 RecordRuleFn pfnKeeps);
};
static_assert(sizeof(void*) != 4 || sizeof(FilterProcess) == 8, "part of the interface");

#endif
