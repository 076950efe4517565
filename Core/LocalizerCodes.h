#ifndef QV_CORE_LOCALIZERCODES_H
#define QV_CORE_LOCALIZERCODES_H

// Kept for programs that include the header by this path.
#include "Core/Records/LocalizerCodes.h"

#endif
