#include "Ledger.h"

#include <algorithm>
#include <cstdint>

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
    // NOLINTNEXTLINE(performance-no-int-to-ptr): a handle is opaque, nobody looks behind it.
    return reinterpret_cast<void*>((serial * kScatter & kHandleMask) * kHandleSpacing);
}

std::string objectName(const Object& object)
{
    return std::string(kKindNames[static_cast<std::size_t>(object.kind)]) + '#' +
           std::to_string(object.ordinal);
}

} // namespace

void* Ledger::create(Kind kind)
{
    void* handle = scatteredHandle(++fSerial);
    const unsigned ordinal = ++fCreated[static_cast<std::size_t>(kind)];
    fAlive.emplace(handle, Object{.kind = kind, .ordinal = ordinal});
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
    fDead.emplace(handle, objectName(found->second));
    fAlive.erase(found);
}

std::string Ledger::name(const void* handle) const
{
    if (!handle)
        return "null";
    if (const auto found = fAlive.find(handle); found != fAlive.end())
        return objectName(found->second);
    const auto dead = fDead.find(handle);
    return dead != fDead.end() ? dead->second : "ptr";
}

std::vector<std::string> Ledger::balance() const
{
    std::vector<const Object*> objects;
    objects.reserve(fAlive.size());
    for (const auto& [handle, object] : fAlive)
        objects.push_back(&object);
    std::sort(objects.begin(), objects.end(), [](const Object* a, const Object* b) {
        return a->kind != b->kind ? a->kind < b->kind : a->ordinal < b->ordinal;
    });

    std::vector<std::string> lines;
    lines.reserve(objects.size());
    for (const Object* object : objects)
        lines.push_back(objectName(*object) + " x" + std::to_string(object->references));
    return lines;
}

} // namespace scripted
