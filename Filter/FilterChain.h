#ifndef QV_FILTER_FILTERCHAIN_H
#define QV_FILTER_FILTERCHAIN_H

#include "Common/Export.h"
#include "Filter/Filter.h"

#include <utils/Vector.h>

// An ordered list of filters that must all hold at once; an empty one lets every contact pass.
// The chain owns its filters and cannot be copied. Reading it takes no lock.
class QV_EXPORT CFilterChain
{
public:
    CFilterChain();
    ~CFilterChain(); // deletes every filter
    CFilterChain(const CFilterChain&) = delete;
    CFilterChain& operator=(const CFilterChain&) = delete;

    // Appends the filter and takes ownership. If the allocation fails, the filter is deleted and
    // GetFilterNum stays as it was. A null filter is appended too and is ignored.
    void SetFilter(CFilter* pFilter);

    // The number of filters, null ones included.
    int GetFilterNum();

    // The filter at iNo, from 0 in the order of appending, still owned by the chain; null if iNo is
    // out of range.
    CFilter* GetFilterByNo(int iNo);

private:
    android::Vector<CFilter*> m_vFilters;
};

#endif
