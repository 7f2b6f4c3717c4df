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
    // Where the channel's traces go. Borrowed from whoever registered the channel.
    std::ostream* output = nullptr;
};

// The channels that exist now, in the order of their registration. Safe from any thread.
VYRA_HOST_API std::vector<TraceChannel> traceChannels();
