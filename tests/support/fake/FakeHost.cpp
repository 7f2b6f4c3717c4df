#include "fake/FakeHost.h"

#include "fake/FakeRuntime.h"
#include "host/Application.h"
#include "host/Environment.h"
#include "host/MemoryMonitor.h"
#include "host/Profiler.h"
#include "host/ResourceWindow.h"

#include <cstdint>
#include <cstdlib>
#include <new>
#include <sstream>

#include <QOpenGLWindow>

namespace scripted {
namespace {

// Writes one line: the parts, one after the other.
template <typename... Parts>
void log(const Parts&... parts)
{
    const InsideRuntime inside;
    std::ostringstream line;
    (line << ... << parts);
    runtime().log(line.str());
}

class CountingMonitor : public Zyl::Objects::AMemoryMonitor {
public:
    void AddToDeviceMemory(std::size_t size) override
    {
        host().deviceMemory += size;
        log("AddToDeviceMemory(", size, ")");
    }
    void ReduceFromDeviceMemory(std::size_t size) override
    {
        host().deviceMemory -= size;
        log("ReduceFromDeviceMemory(", size, ")");
    }
};

} // namespace

HostScript& host()
{
    static HostScript theHost;
    return theHost;
}

} // namespace scripted

using scripted::host;
using scripted::log;

Zyl::Objects::AMemoryMonitor& Zyl::Objects::ObjModel::MemoryMonitor(unsigned int adapter)
{
    static scripted::CountingMonitor theMonitor;
    if (adapter != 0)
        log("MemoryMonitor of another adapter");
    return theMonitor;
}

// The log distinguishes a look-up through the host from getenv.
const char* VyraGetEnv(const char* name)
{
    log("VyraGetEnv(", name, ")");
    return std::getenv(name);
}

TenvironmentVariable::TenvironmentVariable(const char* name) : fName(name) {}

std::int32_t TenvironmentVariable::asInt32(std::int32_t defaultValue) const
{
    log("asInt32(", fName, ", ", defaultValue, ")");
    const char* value = std::getenv(fName);
    return value ? std::atoi(value) : defaultValue;
}

Tstring TappLocale::getResourcesLocation()
{
    log("getResourcesLocation()");
    return "scripted/resources";
}

void TresourceGuard::initializeOffset()
{
    log("initializeOffset()");
}

GLDisplayProperty glDisplayProperty(void* window)
{
    log("glDisplayProperty(", reinterpret_cast<std::uintptr_t>(window), ")");
    return host().display;
}

QOpenGLWindow* Q3dPort::resourceWindow()
{
    log("resourceWindow()");
    return host().resourceWindow;
}

void QOpenGLWindow::makeCurrent()
{
    log("makeCurrent()");
    if (host().makeCurrentThrows)
        throw std::bad_alloc();
}

bool profiler::samplingActive()
{
    return host().sampling;
}

profiler::EventId profiler::eventBegin(std::uint32_t categoryId, Color color, const char* name,
                                       const char* description, const void* data,
                                       std::uint32_t dataSize)
{
    const bool isMain = categoryId == categories().main().id();
    log("eventBegin(", isMain ? "main" : "another category", ", ", color, ", ", name, ", \"",
        description, "\", ", data ? "data" : "null", ", ", dataSize, ")");
    constexpr EventId kEvent = 5; // checked in eventEnd
    return kEvent;
}

void profiler::eventEnd(EventId event)
{
    log("eventEnd(", event, ")");
}
