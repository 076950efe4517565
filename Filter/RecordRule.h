#ifndef QV_FILTER_RECORDRULE_H
#define QV_FILTER_RECORDRULE_H

#include "Core/Records/ContactRecords.h"

class CFilterChain;

// Applies a chain of filters to one record at a time, with the rules of the filter processes.
// Nothing is copied or allocated, so records can be tested in a mapped file, damaged ones too. The
// chain must outlive the object.
class CRecordRule
{
public:
    explicit CRecordRule(CFilterChain& chain) : m_chain(chain) {}

    // Whether the object can replace the pipeline for this chain. False if a filter's process
    // writes log lines (FILTER_ACCOUNT_EXPAND, FILTER_ONLINE), whose order and number would differ
    // record by record, or a filter is of an unknown kind. Null filters are ignored.
    static bool CanTest(CFilterChain& chain);

    // Whether the record passes every filter of the chain.
    bool Keeps(const tag_ContactsStruct& record) const;

private:
    CFilterChain& m_chain;
};

#endif
