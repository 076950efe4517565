#include "Filter/FilterKinds.h"

#include "Filter/AccountExpandFilterProcess.h"
#include "Filter/AccountFilterProcess.h"
#include "Filter/ContactIdExpandFilterProcess.h"
#include "Filter/FavouritesFilterProcess.h"
#include "Filter/GroupExpandFilterProcess.h"
#include "Filter/GroupFilterProcess.h"
#include "Filter/MailFilterProcess.h"
#include "Filter/OnlineFilterProcess.h"
#include "Filter/PhoneFilterProcess.h"
#include "Filter/PostalFilterProcess.h"

#include <algorithm>
#include <new>

namespace
{

constexpr bool LOGS = true;

template <typename Filter>
CFilter* MakePlain(const QVLong32* /*plID*/)
{
    return new (std::nothrow) Filter;
}

template <typename Filter>
CFilter* MakeOfId(const QVLong32* plID)
{
    return new (std::nothrow) Filter(*plID);
}

template <typename Process>
FilterProcess* MakeProcess()
{
    return new (std::nothrow) Process;
}

template <typename Process>
constexpr tag_FilterKind RowOf(CFilter* (*pfnMakeFilter)(const QVLong32*), bool bLogs = false)
{
    return {pfnMakeFilter, MakeProcess<Process>, Process::Keeps, Process::KIND, bLogs};
}

} // namespace

const tag_FilterKind FILTER_KINDS[FILTER_KIND_NUM] = {
    RowOf<AccountFilterProcess>(MakeOfId<CAccountFilter>),
    RowOf<AccountExpandFilterProcess>(MakeOfId<CAccountExpandFilter>, LOGS),
    RowOf<GroupFilterProcess>(MakeOfId<CGroupFilter>),
    RowOf<GroupExpandFilterProcess>(MakeOfId<CGroupExpandFilter>),
    RowOf<PhoneFilterProcess>(MakePlain<CPhoneFilter>),
    RowOf<MailFilterProcess>(MakePlain<CMailFilter>),
    RowOf<FavouritesFilterProcess>(MakePlain<CFavouritesFilter>),
    RowOf<PostalFilterProcess>(MakePlain<CPostalFilter>),
    RowOf<ContactIdExpandFilterProcess>(MakeOfId<CContactIdExpandFilter>),
    RowOf<OnlineFilterProcess>(MakePlain<OnlineFilter>, LOGS),
};

const tag_FilterKind* FindFilterKind(int iKind)
{
    const tag_FilterKind* pEnd = FILTER_KINDS + FILTER_KIND_NUM;
    const tag_FilterKind* pRow = std::find_if(
        FILTER_KINDS, pEnd, [iKind](const tag_FilterKind& row) { return row.iKind == iKind; });
    return pRow != pEnd ? pRow : nullptr;
}
