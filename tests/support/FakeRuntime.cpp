#include "FakeRuntime.h"

#include <mutex>
#include <utility>

namespace scripted {

void FakeRuntime::describe(const World& world)
{
    fWorld = world;
    fLedger = {};
    fFaults.clear();
    fPlatforms.clear();
    fDevices.clear();
    fDeviceScripts.clear();
    fCalls.clear();
    fMisuse.clear();
    fCallCount = 0;
    for (const PlatformScript& platform : world.platforms) {
        void* handle = fLedger.create(Kind::kPlatform);
        fLedger.alive(Kind::kPlatform, handle)->index = fPlatforms.size();
        fPlatforms.push_back(static_cast<cl_platform_id>(handle));
        for (const DeviceScript& device : platform.devices)
            addDevice(device);
    }
}

void FakeRuntime::addDevice(const DeviceScript& script)
{
    void* handle = fLedger.create(Kind::kDevice);
    fLedger.alive(Kind::kDevice, handle)->index = fDevices.size();
    fDevices.push_back(static_cast<cl_device_id>(handle));
    fDeviceScripts.push_back(script);
}

std::vector<std::string> FakeRuntime::takeCalls()
{
    return std::exchange(fCalls, {});
}

void FakeRuntime::log(std::string line)
{
    const std::scoped_lock guard(fLock);
    fCalls.push_back(std::move(line));
}

std::vector<std::string> FakeRuntime::takeMisuse()
{
    return std::exchange(fMisuse, {});
}

unsigned FakeRuntime::references(Kind kind, const void* handle)
{
    const Object* object = fLedger.alive(kind, handle);
    return object ? object->references : 0;
}

std::size_t FakeRuntime::memSize(cl_mem mem)
{
    const Object* object = fLedger.alive(Kind::kMem, mem);
    return object ? object->size : 0;
}

FakeRuntime& runtime()
{
    static FakeRuntime theRuntime;
    return theRuntime;
}

namespace {
thread_local int callsInside = 0;
} // namespace

bool insideRuntime()
{
    return callsInside > 0;
}
InsideRuntime::InsideRuntime()
{
    ++callsInside;
}
InsideRuntime::~InsideRuntime()
{
    --callsInside;
}

} // namespace scripted
