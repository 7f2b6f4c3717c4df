#include "fake/FakeRuntime.h"

#include <cstdint>
#include <mutex>

namespace scripted {

template <typename T>
void FakeRuntime::add(Kind kind, std::vector<T>& list)
{
    void* handle = fLedger.create(kind);
    fLedger.alive(kind, handle)->index = list.size();
    list.push_back(static_cast<T>(handle));
}

void FakeRuntime::describe(const Machine& machine)
{
    fMachine = machine;
    fLedger = {};
    fCommands = {};
    fPlans.clear();
    fPlatforms.clear();
    fDevices.clear();
    fDeviceScripts.clear();
    fCalls.clear();
    fMisuse.clear();
    for (const PlatformScript& platform : machine.platforms) {
        add(Kind::kPlatform, fPlatforms);
        for (const DeviceScript& device : platform.devices) {
            add(Kind::kDevice, fDevices);
            fDeviceScripts.push_back(device);
        }
    }
}

const Fault* FakeRuntime::meetFault(const std::string& function)
{
    const Fault* met = nullptr;
    for (auto& [fault, calls] : fPlans) {
        if (fault.function != "*" && fault.function != function)
            continue;
        ++calls;
        if (calls == fault.nth || (fault.onwards && calls > fault.nth))
            met = &fault;
    }
    return met;
}

void FakeRuntime::log(std::string line)
{
    const std::scoped_lock guard(fLock);
    fCalls.push_back(std::move(line));
}

std::string FakeRuntime::name(const void* handle) const
{
    const auto begin = reinterpret_cast<std::uintptr_t>(fHostMemory.first);
    const std::uintptr_t offset = reinterpret_cast<std::uintptr_t>(handle) - begin;
    return offset < fHostMemory.second ? "host+" + std::to_string(offset) : fLedger.name(handle);
}

unsigned FakeRuntime::references(Kind kind, const void* handle)
{
    const Object* object = fLedger.alive(kind, handle);
    return object ? object->references : 0;
}

FakeRuntime& runtime()
{
    static FakeRuntime theRuntime;
    return theRuntime;
}

int& InsideRuntime::depth()
{
    thread_local int theDepth = 0;
    return theDepth;
}

} // namespace scripted
