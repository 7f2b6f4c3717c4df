#include "FakeHost.h"

#include "FakeRuntime.h"
#include "host/Application.h"
#include "host/MemoryMonitor.h"
#include "host/Profiler.h"
#include "host/ResourceWindow.h"

#include <string>

#include <QOpenGLWindow>

namespace scripted {
namespace {

class CountingMonitor : public Zyl::Objects::AMemoryMonitor {
public:
    void AddToDeviceMemory(std::size_t size) override
    {
        fTotal += size;
        runtime().log("AddToDeviceMemory(" + std::to_string(size) + ")");
    }
    void ReduceFromDeviceMemory(std::size_t size) override
    {
        fTotal -= size;
        runtime().log("ReduceFromDeviceMemory(" + std::to_string(size) + ")");
    }
    std::size_t total() const { return fTotal; }

private:
    std::atomic<std::size_t> fTotal = 0;
};

CountingMonitor& monitor()
{
    static CountingMonitor theMonitor;
    return theMonitor;
}

} // namespace

HostScript& host()
{
    static HostScript theHost;
    return theHost;
}

std::size_t deviceMemory()
{
    return monitor().total();
}

} // namespace scripted

using scripted::host;
using scripted::runtime;

Zyl::Objects::AMemoryMonitor& Zyl::Objects::ObjModel::MemoryMonitor(unsigned int adapter)
{
    if (adapter != 0)
        runtime().log("MemoryMonitor of another adapter");
    return scripted::monitor();
}

Tstring TappLocale::getResourcesLocation()
{
    runtime().log("getResourcesLocation()");
    return "scripted/resources";
}

void TresourceGuard::initializeOffset()
{
    runtime().log("initializeOffset()");
}

GLDisplayProperty glDisplayProperty(void* window)
{
    runtime().log("glDisplayProperty(" + runtime().name(window) + ")");
    return host().display;
}

QOpenGLWindow* Q3dPort::resourceWindow()
{
    runtime().log("resourceWindow()");
    return host().resourceWindow;
}

void QOpenGLWindow::makeCurrent()
{
    runtime().log("makeCurrent()");
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
    runtime().log("eventBegin(" + std::string(isMain ? "main" : "another category") + ", " +
                  std::to_string(color) + ", " + name + ", \"" + description + "\", " +
                  (data ? "data" : "null") + ", " + std::to_string(dataSize) + ")");
    constexpr EventId kEvent = 5; // only its way to eventEnd matters
    return kEvent;
}

void profiler::eventEnd(EventId event)
{
    runtime().log("eventEnd(" + std::to_string(event) + ")");
}
