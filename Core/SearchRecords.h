#ifndef QV_CORE_SEARCHRECORDS_H
#define QV_CORE_SEARCHRECORDS_H

// Kept for programs that include the header by this path.
#include "Core/Records/SearchRecords.h"

#endif
