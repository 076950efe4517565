#ifndef QV_CORE_SEARCHRECORDS_H
#define QV_CORE_SEARCHRECORDS_H

// Kept for programs that know the header by this place.
#include "Core/Records/SearchRecords.h"

#endif
