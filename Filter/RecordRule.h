#ifndef QV_FILTER_RECORDRULE_H
#define QV_FILTER_RECORDRULE_H

#include "Core/Records/ContactRecords.h"

class CFilterChain;

// Decides on one record at a time what the pipeline of filter processes decides on a set, with
// the processes' own rules; nothing is copied or allocated, so records can be tested where they
// lie in a mapped file, damaged ones too. The chain must outlive the object.
class CRecordRule
{
public:
    explicit CRecordRule(CFilterChain& chain) : m_chain(chain) {}

    // Whether the object can take the pipeline's place for this chain. False when a filter's
    // process writes log lines (FILTER_ACCOUNT_EXPAND, FILTER_ONLINE), which come in another
    // order and number record by record, and when a filter is of an unknown kind. Null filters
    // do not matter.
    static bool CanTest(CFilterChain& chain);

    // Whether the record passes every filter of the chain.
    bool Keeps(const tag_ContactsStruct& record) const;

private:
    CFilterChain& m_chain;
};

#endif
