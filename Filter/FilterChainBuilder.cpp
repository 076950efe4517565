#include "Filter/FilterChainBuilder.h"

#include <new>

#include "Filter/FilterChain.h"

namespace
{

// Appends pFilter; false when there was no memory for it or for its place in the chain.
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

// Appends a new filter of the kind; true for an unknown kind, which has none. The id at plID is
// read only for a kind that has one.
bool AppendKind(CFilterChain& chain, int iKind, const QVLong32* plID)
{
    switch (iKind)
    {
    case FILTER_GROUP:
        return Append(chain, new (std::nothrow) CGroupFilter(*plID));
    case FILTER_ACCOUNT:
        return Append(chain, new (std::nothrow) CAccountFilter(*plID));
    case FILTER_PHONE:
        return Append(chain, new (std::nothrow) CPhoneFilter);
    case FILTER_FAVOURITES:
        return Append(chain, new (std::nothrow) CFavouritesFilter);
    case FILTER_GROUP_EXPAND:
        return Append(chain, new (std::nothrow) CGroupExpandFilter(*plID));
    case FILTER_MAIL:
        return Append(chain, new (std::nothrow) CMailFilter);
    case FILTER_POSTAL:
        return Append(chain, new (std::nothrow) CPostalFilter);
    case FILTER_ACCOUNT_EXPAND:
        return Append(chain, new (std::nothrow) CAccountExpandFilter(*plID));
    case FILTER_CONTACT_ID_EXPAND:
        return Append(chain, new (std::nothrow) CContactIdExpandFilter(*plID));
    case FILTER_ONLINE:
        return Append(chain, new (std::nothrow) OnlineFilter);
    default:
        return true;
    }
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
        if (!AppendKind(**ppChain, piType[i], plID + i))
        {
            return -1;
        }
    }
    return 0;
}
