#ifndef QV_CORE_CONTACTRECORDS_H
#define QV_CORE_CONTACTRECORDS_H

// Kept for programs that include the header by this path.
#include "Core/Records/ContactRecords.h"

#endif
