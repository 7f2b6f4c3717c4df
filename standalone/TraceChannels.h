// The trace channels that are registered with the host.
#pragma once

#include "host/HostExport.h"

#include <iosfwd>
#include <string>
#include <vector>

struct TraceChannel {
    int level = 0;
    std::string name;
    std::string description;
    // The stream that receives the traces. Owned by the code that registered the channel.
    std::ostream* output = nullptr;
};

// Returns the channels that exist, in the order of their registration. Safe from any thread.
VYRA_HOST_API std::vector<TraceChannel> traceChannels();
