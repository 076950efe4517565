#ifndef QV_MEMMANAGER_SHAREMEMORY_H
#define QV_MEMMANAGER_SHAREMEMORY_H

// Kept for programs that know the header by this place.
#include "MemManager/Files/ShareMemory.h"

#endif
