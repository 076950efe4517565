#include "Filter/RecordRule.h"

#include "Filter/AccountExpandFilterProcess.h"
#include "Filter/AccountFilterProcess.h"
#include "Filter/ContactIdExpandFilterProcess.h"
#include "Filter/FavouritesFilterProcess.h"
#include "Filter/FilterChain.h"
#include "Filter/GroupExpandFilterProcess.h"
#include "Filter/GroupFilterProcess.h"
#include "Filter/MailFilterProcess.h"
#include "Filter/OnlineFilterProcess.h"
#include "Filter/PhoneFilterProcess.h"
#include "Filter/PostalFilterProcess.h"

namespace
{

// The rule of the kind's process; null for a kind that no process serves.
RecordRuleFn RuleOf(int iKind)
{
    switch (iKind)
    {
    case AccountFilterProcess::KIND:
        return AccountFilterProcess::Keeps;
    case AccountExpandFilterProcess::KIND:
        return AccountExpandFilterProcess::Keeps;
    case GroupFilterProcess::KIND:
        return GroupFilterProcess::Keeps;
    case GroupExpandFilterProcess::KIND:
        return GroupExpandFilterProcess::Keeps;
    case PhoneFilterProcess::KIND:
        return PhoneFilterProcess::Keeps;
    case MailFilterProcess::KIND:
        return MailFilterProcess::Keeps;
    case FavouritesFilterProcess::KIND:
        return FavouritesFilterProcess::Keeps;
    case PostalFilterProcess::KIND:
        return PostalFilterProcess::Keeps;
    case ContactIdExpandFilterProcess::KIND:
        return ContactIdExpandFilterProcess::Keeps;
    case OnlineFilterProcess::KIND:
        return OnlineFilterProcess::Keeps;
    default:
        return nullptr;
    }
}

bool WritesLogLines(int iKind)
{
    return iKind == FILTER_ACCOUNT_EXPAND || iKind == FILTER_ONLINE;
}

} // namespace

bool CRecordRule::CanTest(CFilterChain& chain)
{
    for (int k = 0; k < chain.GetFilterNum(); ++k)
    {
        const CFilter* pFilter = chain.GetFilterByNo(k);
        if (pFilter != nullptr &&
            (RuleOf(pFilter->m_iType) == nullptr || WritesLogLines(pFilter->m_iType)))
        {
            return false;
        }
    }
    return true;
}

bool CRecordRule::Keeps(const tag_ContactsStruct& record) const
{
    for (int k = 0; k < m_chain.GetFilterNum(); ++k)
    {
        const CFilter* pFilter = m_chain.GetFilterByNo(k);
        const RecordRuleFn pfnKeeps = pFilter != nullptr ? RuleOf(pFilter->m_iType) : nullptr;
        if (pfnKeeps != nullptr && !pfnKeeps(record, *pFilter, m_chain))
        {
            return false;
        }
    }
    return true;
}
