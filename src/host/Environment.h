// The host's look-ups of environment variables.
#pragma once

#include "host/HostExport.h"

#include <cstdint>

// The value of `name`, or null when it is not set. The text belongs to the environment.
VYRA_HOST_API const char* VyraGetEnv(const char* name);

// One environment variable, read when it is asked for.
class VYRA_HOST_API TenvironmentVariable {
public:
    // `name` is borrowed and must outlive the object.
    explicit TenvironmentVariable(const char* name);

    // The value as a decimal integer; `defaultValue` when the variable is not set, is not an
    // integer or does not fit 32 bits.
    std::int32_t asInt32(std::int32_t defaultValue) const;

private:
    const char* fName;
};
