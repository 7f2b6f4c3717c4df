// The decisions on how OpenCL and the renderer wait for each other.
#pragma once

#include "tools/info/rules/Decisions.h"

#include <string>

namespace info {

// Return a mode's name with its number: "implicit (1)".
std::string graphicsToCLModeName(TopenCLInfo::GraphicsToCLSyncMode mode);
std::string clToGraphicsModeName(TopenCLInfo::CLToGraphicsSyncMode mode);

// Return the mode that the library would choose without a variable that forces one.
TopenCLInfo::GraphicsToCLSyncMode automaticGraphicsToCLMode(const Diagnostics& diagnostics);
TopenCLInfo::CLToGraphicsSyncMode automaticCLToGraphicsMode(const Diagnostics& diagnostics);

Decision decideGraphicsToCL(const Diagnostics& diagnostics);
Decision decideCLToGraphics(const Diagnostics& diagnostics);
Decision decideThreadedSharing(const Diagnostics& diagnostics);
Decision decideBatching(const Diagnostics& diagnostics);

} // namespace info
