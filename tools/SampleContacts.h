#ifndef QV_TOOLS_SAMPLECONTACTS_H
#define QV_TOOLS_SAMPLECONTACTS_H

#include "tools/DatabaseContact.h"

#include <cstdint>
#include <vector>

// Groups and accounts of the sample are numbered from 1.
constexpr int SAMPLE_GROUPS = 6;
constexpr int SAMPLE_ACCOUNTS = 4;

// Makes iCount contacts with names of every kind (simplified, traditional, polyphonic, Latin,
// mixed, digits, none) and every attribute that a filter tests. The same count and time always give
// the same contacts; the times of last contact go back from llNow.
std::vector<tag_DatabaseContact> MakeSampleContacts(int iCount, int64_t llNow);

#endif
