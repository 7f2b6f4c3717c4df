// How the library orders the work of OpenCL and of the renderer, and why.
#pragma once

#include "tools/info/rules/Decisions.h"

#include <string>

namespace info {

// "implicit (1)"
std::string graphicsToCLModeName(TopenCLInfo::GraphicsToCLSyncMode mode);
std::string clToGraphicsModeName(TopenCLInfo::CLToGraphicsSyncMode mode);

// What the library would choose if no variable forced a mode.
TopenCLInfo::GraphicsToCLSyncMode automaticGraphicsToCLMode(const Facts& facts);
TopenCLInfo::CLToGraphicsSyncMode automaticCLToGraphicsMode(const Facts& facts);

Decision decideGraphicsToCL(const Facts& facts);
Decision decideCLToGraphics(const Facts& facts);
Decision decideThreadedSharing(const Facts& facts);
Decision decideBatching(const Facts& facts);

} // namespace info
