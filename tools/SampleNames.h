#ifndef QV_TOOLS_SAMPLENAMES_H
#define QV_TOOLS_SAMPLENAMES_H

#include <string>

// Name number iIndex (from 0) of the sample contacts in UTF-8, always the same for an index.
// The first ones show one rule each; the others are combined from lists.
std::string SampleName(int iIndex);

#endif
