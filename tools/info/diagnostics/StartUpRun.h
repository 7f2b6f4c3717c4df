// The library's start-up, listened to.
#pragma once

#include "tools/info/diagnostics/Diagnostics.h"

#include <optional>
#include <string>

namespace info {

class RenderWindow;
class WarningLog;

// Initialises the library for the window and notes what it said and left behind. Once in a process.
// Nothing is attempted where there is no renderer.
StartUp runStartUp(const RenderWindow& window, unsigned vendorId, WarningLog& warnings);

// The vendor whose platform start-up looks for; empty when the id belongs to none that it knows.
std::optional<std::string> wantedVendor(unsigned vendorId);

} // namespace info
