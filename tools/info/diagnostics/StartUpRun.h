// The library's start-up, with a record of its output.
#pragma once

#include "tools/info/diagnostics/Diagnostics.h"

#include <optional>
#include <string>

namespace info {

class RenderWindow;
class WarningLog;

// Initialises the library for `window`, and records its output, its warnings and its result. Does
// nothing if the renderer is not usable. Once in a process.
[[nodiscard]] StartUp runStartUp(const RenderWindow& window, unsigned vendorId,
                                 WarningLog& warnings);

// Returns the vendor whose platform start-up looks for. Empty if the vendor id is unknown.
[[nodiscard]] std::optional<std::string> wantedVendor(unsigned vendorId);

} // namespace info
