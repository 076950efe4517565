#ifndef QV_CORE_CONTACTRECORDS_H
#define QV_CORE_CONTACTRECORDS_H

// Kept for programs that know the header by this place.
#include "Core/Records/ContactRecords.h"

#endif
