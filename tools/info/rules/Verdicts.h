// Which of the machine's platforms and devices start-up accepts, and why not the others.
#pragma once

#include "tools/info/diagnostics/Diagnostics.h"

#include <string>

namespace info {

// The first test that failed; empty for the one that was accepted.
std::string platformRejection(const Facts& facts, const Platform& platform);
// `device` is one of `platform`.
std::string deviceRejection(const Facts& facts, const Platform& platform, const Device& device);

// What to know about the renderer's GPU beside the device's: empty when they are of one maker.
std::string rendererBesideDevice(const Facts& facts);

} // namespace info
