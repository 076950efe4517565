#include "Filter/OnlineFilterProcess.h"

#include "Common/Log.h"

namespace
{

constexpr const char* TRACE_TAG = "Filter/OnlineFilterProcess";

} // namespace

bool OnlineFilterProcess::Keeps(const tag_ContactsStruct& record, const CFilter& filter,
                                CFilterChain& chain)
{
    const bool bOnline = HasFlag<CONTACT_FLAG_ONLINE>(record, filter, chain);
    if (bOnline)
    {
        QV_LOGD(TRACE_TAG, "OnlineFilterProcess: find one contact is  sms online\n");
    }
    return bOnline;
}

int OnlineFilterProcess::FilterRecord(tag_ContactsInfo* pInfo, CFilterChain& chain)
{
    return FilterByRule(pInfo, chain, KIND, Keeps);
}
