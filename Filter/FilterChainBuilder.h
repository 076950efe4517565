#ifndef QV_FILTER_FILTERCHAINBUILDER_H
#define QV_FILTER_FILTERCHAINBUILDER_H

#include "Core/Records/ContactRecords.h"

class CFilterChain;

// Makes a chain of the filters that two parallel arrays of iNum entries describe: piType[i] is a
// FILTER_* kind, plID[i] the group, account or contact it is about, not read for kinds without
// one. Entries of unknown kinds are skipped; without entries (iNum 0 or less) the chain is empty.
// Returns 0, or -1 if a pointer is null (nothing is written) or an allocation fails. *ppChain is
// the new chain, owned by the caller; if a filter's allocation fails, it holds the filters made so
// far; if its own fails, it is null.
int BuildFilterChain(const int* piType, const QVLong32* plID, int iNum, CFilterChain** ppChain);

#endif
