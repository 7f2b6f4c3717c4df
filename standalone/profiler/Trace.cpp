#include "host/Trace.h"

#include "standalone/TraceChannels.h"

#include <algorithm>
#include <iostream>
#include <mutex>
#include <vector>

namespace {

struct Registration {
    const TdbTrace* owner;
    TraceChannel channel;
};

struct Registry {
    std::mutex mutex;
    std::vector<Registration> channels;
};

// Never destroyed: channels are static objects of other modules, which may be destroyed later.
Registry& registry()
{
    static auto* const theOne = new Registry;
    return *theOne;
}

} // namespace

TdbTrace::TdbTrace(int level, const char* name, std::ostream& output, const char* description)
    : fLevel(level), fName(name), fOutput(&output), fDescription(description)
{
    const std::scoped_lock lock(registry().mutex);
    registry().channels.push_back({this, {fLevel, fName, fDescription, fOutput}});
}

TdbTrace::~TdbTrace()
{
    const std::scoped_lock lock(registry().mutex);
    std::erase_if(registry().channels,
                  [this](const Registration& entry) { return entry.owner == this; });
}

std::ostream& TdebugOutput::sCerr()
{
    return std::cerr;
}

std::vector<TraceChannel> traceChannels()
{
    const std::scoped_lock lock(registry().mutex);
    std::vector<TraceChannel> channels;
    channels.reserve(registry().channels.size());
    for (const Registration& entry : registry().channels) {
        channels.push_back(entry.channel);
    }
    return channels;
}
