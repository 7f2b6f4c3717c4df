// The host's access to environment variables.
#pragma once

#include "host/HostExport.h"

#include <cstdint>

// Returns the value of `name`, or null if it is not set. The environment owns the text.
VYRA_HOST_API const char* VyraGetEnv(const char* name);

// One environment variable, read on each call.
class VYRA_HOST_API TenvironmentVariable {
public:
    // `name` is borrowed and must outlive the object.
    explicit TenvironmentVariable(const char* name);

    // Returns the value as a decimal integer, or `defaultValue` if the variable is not set, is not
    // an integer or does not fit 32 bits.
    std::int32_t asInt32(std::int32_t defaultValue) const;

private:
    const char* fName;
};
