#ifndef QV_MEMMANAGER_SHAREMEMORY_H
#define QV_MEMMANAGER_SHAREMEMORY_H

// Kept for programs that include the header by this path.
#include "MemManager/Files/ShareMemory.h"

#endif
