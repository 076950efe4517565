#include "Filter/Filter.h"

CFilter::CFilter(int iType) : m_iType(iType) {}

CFilter::~CFilter() = default;

CGroupFilter::CGroupFilter(int iGroupID) : CFilter(FILTER_GROUP), m_iID(iGroupID) {}

int CGroupFilter::GetGroupID()
{
    return m_iID;
}

CGroupExpandFilter::CGroupExpandFilter(int iGroupID) : CFilter(FILTER_GROUP_EXPAND), m_iID(iGroupID)
{
}

int CGroupExpandFilter::GetGroupID()
{
    return m_iID;
}

CAccountFilter::CAccountFilter(int iAccountID) : CFilter(FILTER_ACCOUNT), m_iID(iAccountID) {}

int CAccountFilter::GetAccountID()
{
    return m_iID;
}

CAccountExpandFilter::CAccountExpandFilter(int iAccountID)
    : CFilter(FILTER_ACCOUNT_EXPAND), m_iID(iAccountID)
{
}

int CAccountExpandFilter::GetAccountID()
{
    return m_iID;
}

CContactIdExpandFilter::CContactIdExpandFilter(int iContactID)
    : CFilter(FILTER_CONTACT_ID_EXPAND), m_iID(iContactID)
{
}

int CContactIdExpandFilter::GetContactID()
{
    return m_iID;
}

CPhoneFilter::CPhoneFilter() : CFilter(FILTER_PHONE) {}

CMailFilter::CMailFilter() : CFilter(FILTER_MAIL) {}

CFavouritesFilter::CFavouritesFilter() : CFilter(FILTER_FAVOURITES) {}

CPostalFilter::CPostalFilter() : CFilter(FILTER_POSTAL) {}

OnlineFilter::OnlineFilter() : CFilter(FILTER_ONLINE) {}
