#include "Filter/FilterChainBuilder.h"

#include "Filter/Filter.h"
#include "Filter/FilterChain.h"
#include "Filter/FilterKinds.h"

#include <new>

namespace
{

// Appends pFilter; false if its allocation failed (null) or that of its place in the chain fails.
bool Append(CFilterChain& chain, CFilter* pFilter)
{
    if (pFilter == nullptr)
    {
        return false;
    }
    const int iBefore = chain.GetFilterNum();
    chain.SetFilter(pFilter);
    return chain.GetFilterNum() > iBefore;
}

} // namespace

int BuildFilterChain(const int* piType, const QVLong32* plID, int iNum, CFilterChain** ppChain)
{
    if (piType == nullptr || plID == nullptr || ppChain == nullptr)
    {
        return -1;
    }
    *ppChain = new (std::nothrow) CFilterChain;
    if (*ppChain == nullptr)
    {
        return -1;
    }
    for (int i = 0; i < iNum; ++i)
    {
        const tag_FilterKind* pKind = FindFilterKind(piType[i]);
        if (pKind != nullptr && !Append(**ppChain, pKind->pfnMakeFilter(plID + i)))
        {
            return -1;
        }
    }
    return 0;
}
