#ifndef QV_FILTER_FILTERKINDS_H
#define QV_FILTER_FILTERKINDS_H

#include "Filter/FilterProcess.h"

// One kind of filter. The makers return objects that the caller owns, null if the allocation fails.
struct tag_FilterKind
{
    CFilter* (*pfnMakeFilter)(const QVLong32* plID); // reads the id if the kind has one
    FilterProcess* (*pfnMakeProcess)();
    RecordRuleFn pfnKeeps; // the rule of the process
    int iKind;
    bool bLogs; // the rule writes log lines
};

// The table of all kinds in the order of the pipeline. A new kind is a row here and a file with
// its process.
constexpr int FILTER_KIND_NUM = 10;
extern const tag_FilterKind FILTER_KINDS[FILTER_KIND_NUM];

// The row of a kind; null when there is none.
const tag_FilterKind* FindFilterKind(int iKind);

#endif
