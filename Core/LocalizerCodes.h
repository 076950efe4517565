#ifndef QV_CORE_LOCALIZERCODES_H
#define QV_CORE_LOCALIZERCODES_H

// Kept for programs that know the header by this place.
#include "Core/Records/LocalizerCodes.h"

#endif
