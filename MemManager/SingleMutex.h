#ifndef QV_MEMMANAGER_SINGLEMUTEX_H
#define QV_MEMMANAGER_SINGLEMUTEX_H

// Kept for programs that know the header by this place.
#include "MemManager/Files/SingleMutex.h"

#endif
