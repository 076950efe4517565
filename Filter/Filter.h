#ifndef QV_FILTER_FILTER_H
#define QV_FILTER_FILTER_H

#include "Common/Export.h"

#include <cstdint>

// Kinds of filter. 3 and 4 are unused.
constexpr int FILTER_GROUP = 0;              // members of a group
constexpr int FILTER_ACCOUNT = 1;            // contacts with data in an account
constexpr int FILTER_PHONE = 2;              // contacts with a phone number
constexpr int FILTER_FAVOURITES = 5;         // starred contacts
constexpr int FILTER_GROUP_EXPAND = 6;       // contacts outside a group
constexpr int FILTER_MAIL = 7;               // contacts with a mail address
constexpr int FILTER_POSTAL = 8;             // contacts with a postal address
constexpr int FILTER_ACCOUNT_EXPAND = 9;     // contacts not confined to the excluded accounts
constexpr int FILTER_CONTACT_ID_EXPAND = 10; // all contacts but one
constexpr int FILTER_ONLINE = 11;            // contacts that are online

// Describes one condition on contacts; the filter processes apply it. A filter of one of the kinds
// above must be of that kind's class, because the processes read its id through that class. Filters
// of any other kind are ignored.
class QV_EXPORT CFilter
{
public:
    virtual ~CFilter();
    CFilter(const CFilter&) = delete;
    CFilter& operator=(const CFilter&) = delete;

    int32_t m_iType; // FILTER_*

protected:
    explicit CFilter(int iType); // of the given kind
};
static_assert(sizeof(void*) != 4 || sizeof(CFilter) == 8, "part of the interface");

// Keeps the members of a group; SECRET_GROUP_ID of Core/Records/ContactRecords.h: secret contacts.
class QV_EXPORT CGroupFilter : public CFilter
{
public:
    // Of the group with this id.
    explicit CGroupFilter(int iGroupID);
    int GetGroupID(); // for callers outside: nothing in the library calls this
    int32_t m_iID;
};
static_assert(sizeof(void*) != 4 || sizeof(CGroupFilter) == 12, "part of the interface");

// Keeps the contacts outside a group.
class QV_EXPORT CGroupExpandFilter : public CFilter
{
public:
    // Of the group with this id.
    explicit CGroupExpandFilter(int iGroupID);
    int GetGroupID(); // for callers outside: nothing in the library calls this
    int32_t m_iID;
};

// Keeps the contacts with data in an account.
class QV_EXPORT CAccountFilter : public CFilter
{
public:
    // Of the account with this id.
    explicit CAccountFilter(int iAccountID);
    int GetAccountID(); // for callers outside: nothing in the library calls this
    int32_t m_iID;
};

// Excludes an account: removes the contacts all of whose accounts the chain's filters exclude.
class QV_EXPORT CAccountExpandFilter : public CFilter
{
public:
    // Of the account with this id.
    explicit CAccountExpandFilter(int iAccountID);
    int GetAccountID(); // for callers outside: nothing in the library calls this
    int32_t m_iID;
};

// Keeps all contacts but one.
class QV_EXPORT CContactIdExpandFilter : public CFilter
{
public:
    // Of the contact with this id.
    explicit CContactIdExpandFilter(int iContactID);
    int GetContactID(); // for callers outside: nothing in the library calls this
    int32_t m_iID;
};

// Keeps the contacts with a phone number.
class QV_EXPORT CPhoneFilter : public CFilter
{
public:
    CPhoneFilter(); // of kind FILTER_PHONE
};

// Keeps the contacts with a mail address.
class QV_EXPORT CMailFilter : public CFilter
{
public:
    CMailFilter(); // of kind FILTER_MAIL
};

// Keeps the starred contacts.
class QV_EXPORT CFavouritesFilter : public CFilter
{
public:
    CFavouritesFilter(); // of kind FILTER_FAVOURITES
};

// Keeps the contacts with a postal address.
class QV_EXPORT CPostalFilter : public CFilter
{
public:
    CPostalFilter(); // of kind FILTER_POSTAL
};

// Keeps the contacts that are online.
class QV_EXPORT OnlineFilter : public CFilter
{
public:
    OnlineFilter(); // of kind FILTER_ONLINE
};

#endif
