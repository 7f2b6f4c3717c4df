// A ledger of all objects that the scripted runtime has returned, with their references.
#pragma once

#include <array>
#include <cstddef>
#include <deque>
#include <map>
#include <string>
#include <unordered_map>
#include <vector>

#include <CL/cl.h>

namespace scripted {

// kSync is an OpenGL sync object: it is deleted, not counted.
enum class Kind { kPlatform, kDevice, kContext, kQueue, kMem, kEvent, kProgram, kKernel, kSync };
inline constexpr std::size_t kKindCount = 9;

struct KernelArgument {
    bool isMemory = false;
    bool set = false;
    cl_mem mem = nullptr; // borrowed
};

struct Object {
    Kind kind;
    unsigned ordinal; // counts from 1 within the kind
    std::string name; // "mem#2"
    unsigned references = 1;

    std::size_t index = 0; // platforms and devices: place in the machine
    std::size_t size = 0;  // memory objects: bytes
    bool shared = false;   // memory objects: made from a renderer's buffer
    bool acquired = false; // shared memory objects
    // Of shared memory objects, numbers of commands: the last acquire, its uses, the last release.
    unsigned acquire = 0;
    std::vector<unsigned> uses{};
    unsigned release = 0;
    bool mapped = false;                     // memory objects
    bool built = false;                      // programs: built successfully
    std::string source{};                    // programs
    std::vector<KernelArgument> arguments{}; // kernels
    bool profiled = false;                   // queues, and the events of their commands
    unsigned command = 0;                    // events: its number
    std::deque<cl_int> statuses{}; // events: statuses of the next queries; the last one repeats
};

// Handles are numbers, not addresses: a released one is recognised without accessing it. Their
// order is scattered, so that nothing is in order of creation by accident.
class Ledger {
public:
    // Creates an object with one reference.
    void* create(Kind kind);
    // Returns the existing object of that kind, or null. Valid until its last release.
    Object* alive(Kind kind, const void* handle);
    // Removes one reference, and the object with the last one.
    void release(const void* handle);

    // Returns "mem#2" for any object that ever existed, "null", or "ptr".
    std::string name(const void* handle) const;
    // Removes the records of released objects; their handles then have no name.
    void forgetDead() { fDead.clear(); }
    // Returns the number of objects of that kind created so far.
    unsigned created(Kind kind) const { return fCreated[static_cast<std::size_t>(kind)]; }
    // Returns one line per existing object, in order of kind and creation: "mem#2 x1". Platforms
    // and devices, which are never released, are left out.
    std::vector<std::string> balance() const;
    // Returns the names of the acquired memory objects.
    std::vector<std::string> acquired() const;

private:
    std::map<const void*, Object> fAlive;
    std::unordered_map<const void*, std::string> fDead;
    std::array<unsigned, kKindCount> fCreated{};
    unsigned fSerial = 0;
};

} // namespace scripted
