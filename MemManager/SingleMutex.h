#ifndef QV_MEMMANAGER_SINGLEMUTEX_H
#define QV_MEMMANAGER_SINGLEMUTEX_H

// Kept for programs that include the header by this path.
#include "MemManager/Files/SingleMutex.h"

#endif
