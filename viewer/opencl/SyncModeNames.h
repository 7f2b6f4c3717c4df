// The synchronisation modes by their numbers, as the environment variables take them, and names.
#pragma once

#include "runtime/TopenCLInfo.h"

namespace viewer {

const char* nameOf(TopenCLInfo::GraphicsToCLSyncMode mode);
const char* nameOf(TopenCLInfo::CLToGraphicsSyncMode mode);

} // namespace viewer
