#include "Filter/Filter.h"

CFilter::CFilter(int iType) : m_iType(iType) {}

CFilter::~CFilter() = default;

CGroupFilter::CGroupFilter(int iGroupID) : CFilter(FILTER_GROUP), m_iID(iGroupID) {}

CGroupExpandFilter::CGroupExpandFilter(int iGroupID) : CFilter(FILTER_GROUP_EXPAND), m_iID(iGroupID)
{
}

CAccountFilter::CAccountFilter(int iAccountID) : CFilter(FILTER_ACCOUNT), m_iID(iAccountID) {}

CAccountExpandFilter::CAccountExpandFilter(int iAccountID)
    : CFilter(FILTER_ACCOUNT_EXPAND), m_iID(iAccountID)
{
}

CContactIdExpandFilter::CContactIdExpandFilter(int iContactID)
    : CFilter(FILTER_CONTACT_ID_EXPAND), m_iID(iContactID)
{
}

CPhoneFilter::CPhoneFilter() : CFilter(FILTER_PHONE) {}

CMailFilter::CMailFilter() : CFilter(FILTER_MAIL) {}

CFavouritesFilter::CFavouritesFilter() : CFilter(FILTER_FAVOURITES) {}

CPostalFilter::CPostalFilter() : CFilter(FILTER_POSTAL) {}

OnlineFilter::OnlineFilter() : CFilter(FILTER_ONLINE) {}
