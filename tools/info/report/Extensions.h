// The OpenCL extensions that the library's decisions depend on.
#pragma once

#include <span>

namespace info {

struct Extension {
    const char* name;
    const char* purpose;
};

std::span<const Extension> relevantExtensions();

} // namespace info
