#include "fake/Ledger.h"

#include <cstdint>
#include <utility>

namespace scripted {
namespace {

constexpr std::array<const char*, kKindCount> kKindNames = {
    "platform", "device", "context", "queue", "mem", "event", "program", "kernel", "sync"};

// Multiplying by an odd number permutes the 24-bit numbers, so no two handles are equal.
constexpr std::uintptr_t kScatter = 0x9E3779B1;
constexpr std::uintptr_t kHandleMask = 0xFFFFFF;
constexpr std::uintptr_t kHandleSpacing = 16;

void* scatteredHandle(unsigned serial)
{
    // NOLINTNEXTLINE(performance-no-int-to-ptr): a handle is never dereferenced.
    return reinterpret_cast<void*>((serial * kScatter & kHandleMask) * kHandleSpacing);
}

} // namespace

void* Ledger::create(Kind kind)
{
    void* handle = scatteredHandle(++fSerial);
    while (!handle || fAlive.contains(handle)) // after kHandleMask objects
        handle = scatteredHandle(++fSerial);
    const auto index = static_cast<std::size_t>(kind);
    const unsigned ordinal = ++fCreated[index];
    std::string name = std::string(kKindNames[index]) + '#' + std::to_string(ordinal);
    fAlive.emplace(handle, Object{.kind = kind, .ordinal = ordinal, .name = std::move(name)});
    return handle;
}

Object* Ledger::alive(Kind kind, const void* handle)
{
    const auto found = fAlive.find(handle);
    return found != fAlive.end() && found->second.kind == kind ? &found->second : nullptr;
}

void Ledger::release(const void* handle)
{
    const auto found = fAlive.find(handle);
    if (--found->second.references > 0)
        return;
    fDead.emplace(handle, found->second.name);
    fAlive.erase(found);
}

std::string Ledger::name(const void* handle) const
{
    if (!handle)
        return "null";
    if (const auto found = fAlive.find(handle); found != fAlive.end())
        return found->second.name;
    const auto dead = fDead.find(handle);
    return dead != fDead.end() ? dead->second : "ptr";
}

std::vector<std::string> Ledger::balance() const
{
    std::map<std::pair<Kind, unsigned>, const Object*> sorted;
    for (const auto& [handle, object] : fAlive) {
        if (object.kind != Kind::kPlatform && object.kind != Kind::kDevice)
            sorted[{object.kind, object.ordinal}] = &object;
    }
    std::vector<std::string> lines;
    lines.reserve(sorted.size());
    for (const auto& [place, object] : sorted)
        lines.push_back(object->name + " x" + std::to_string(object->references));
    return lines;
}

std::vector<std::string> Ledger::acquired() const
{
    std::vector<std::string> names;
    for (const auto& [handle, object] : fAlive) {
        if (object.acquired)
            names.push_back(object.name);
    }
    return names;
}

} // namespace scripted
