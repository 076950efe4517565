#ifndef QV_TESTS_STRESS_PROVIDERACTIONS_H
#define QV_TESTS_STRESS_PROVIDERACTIONS_H

#include "tests/Support/ProviderDatabase.h"

#include <random>
#include <string>
#include <vector>

class CLocalizerLogic;

enum ACTION_KIND
{
    ACTION_CONTACTS,  // a few contacts appear, change or go, named in one call
    ACTION_MANY,      // the same in a list too long for a patch
    ACTION_ALL,       // the same without a list
    ACTION_STATUS,    // contacts go online or offline
    ACTION_TIME,      // a contact was contacted, later than any other
    ACTION_STAR,      // a contact becomes a favourite or ceases to be one
    ACTION_SORT_TYPE, // the other sort type is set
    ACTION_BUILD,     // the index is built by MemInit
    ACTION_KINDS
};
const char* ActionName(ACTION_KIND eKind);

// What the database was changed in, to be told to the library.
struct tag_Action
{
    ACTION_KIND eKind = ACTION_ALL;
    std::vector<long long> vIds{}; // the contacts concerned
    long long llValue = 0;         // the time, sort type or whether it is a favourite
};

// The provider: random changes of its database that keep the rules under which the index ends
// like a fresh build, and their notifications. Keys are made from the display names, status ids
// are unique, times of contact only grow and are told before any other change of the contact.
class CProviderActions
{
public:
    explicit CProviderActions(unsigned int uSeed);

    // Contacts 1 to iContacts, before the first change.
    void Fill(int iContacts);
    tag_Action Change(ACTION_KIND eKind);
    // A kind as often as a provider needs it.
    ACTION_KIND AnyKind();
    // Calls the library for the change, a build until it succeeds.
    static void Notify(CLocalizerLogic& logic, tag_Action action);

    int VisibleContacts() { return Ask("select count(*) from visible_contacts"); }

private:
    int Pick(int iNum) { return static_cast<int>(m_random() % static_cast<unsigned int>(iNum)); }
    template <typename T, size_t N>
    T AnyOf(T const (&all)[N])
    {
        return all[Pick(static_cast<int>(N))];
    }
    int Ask(const std::string& strSql);
    long long LatestTime();
    int AnyVisible();
    std::string AnyName();
    tag_ProviderContact AnyContact(int iId);
    void ChangeContact(int iId);
    void ChangeContacts(std::vector<long long>& vIds);

    std::mt19937 m_random;
    CProviderDatabase m_database;
};

#endif
