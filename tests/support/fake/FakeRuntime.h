// The scripted OpenCL runtime behind the entry points: what a test sets, and what it reads.
//
// The entry points live in a shared library that has the name of the OpenCL library. The tests'
// executables are linked to it, so it is in the process already when the code under test opens
// OpenCL by name, and the loader hands it out. Extension entry points are not exported: they are
// found through clGetExtensionFunctionAddress alone, unless the world leaves them out.
//
// Any thread may call an entry point. What is declared here is for the test's own thread, while
// nobody else calls.
#pragma once

#include "World.h"
#include "fake/CommandOrder.h"
#include "fake/Ledger.h"

#include <atomic>
#include <deque>
#include <string>
#include <utility>
#include <vector>

namespace scripted {

// A spin lock without a trace in ThreadSanitizer's eyes: the runtime's library is built without it.
// A mutex here would order the threads of the code under test and so hide their races.
class QuietLock {
public:
    void lock()
    {
        while (fHeld.test_and_set(std::memory_order_acquire))
            ;
    }
    void unlock() { fHeld.clear(std::memory_order_release); }

private:
    std::atomic_flag fHeld;
};

using ContextNotify = void(CL_CALLBACK*)(const char*, const void*, std::size_t, void*);

class FakeRuntime {
public:
    // Forgets everything and makes the platforms and devices of `world`.
    void describe(const World& world);

    // The calls since the last take, OpenCL's, OpenGL's and the host's in one order, each as text:
    //     clEnqueueWriteBuffer(queue#1, mem#2, 0, 16, 64, host+16, [event#1]) = event#3
    //     clCreateBuffer(context#1, 4, 64, null) ! -4
    //     clEnqueueNDRangeKernel(queue#1, kernel#1, 64, 64, []) on [mem#1, mem#2] = event#4
    // Lists are in brackets; the first form names what the call made, the second its status, the
    // third the memory objects in the kernel's arguments.
    std::vector<std::string> takeCalls() { return std::exchange(fCalls, {}); }
    // A line of the host's in the same log.
    void log(std::string line);

    void plan(const Fault& fault) { fPlans.push_back({fault}); }
    void clearFaults() { fPlans.clear(); }

    // Wrong use that a validating runtime would refuse: "clReleaseEvent: event#1 is dead".
    std::vector<std::string> takeMisuse() { return std::exchange(fMisuse, {}); }

    std::vector<std::string> balance() const { return fLedger.balance(); }
    // The name of an object, "host+OFFSET" for an address in the host memory, else "null" or "ptr".
    std::string name(const void* handle) const;
    // The test's memory that transfers read and write, which the log then names.
    void setHostMemory(const void* begin, std::size_t bytes) { fHostMemory = {begin, bytes}; }
    void forgetDead() { fLedger.forgetDead(); }
    unsigned created(Kind kind) const { return fLedger.created(kind); }
    // References of a living object, else 0.
    unsigned references(Kind kind, const void* handle);
    // Bytes of a living memory object.
    std::size_t memSize(cl_mem mem);

    // The renderer's buffers that are acquired, by name.
    std::vector<std::string> acquired() const;
    // Whether commands stay incomplete until somebody waits for them, or until completeCommands.
    void holdCommands(bool hold) { fCommands.hold(hold); }
    void completeCommands() { fCommands.completeAll(); }

    // What the queries of every event made from now on answer, in turn; the last one stays. The
    // default is one CL_COMPLETE. Waiting for an event completes it.
    void scriptEventStatuses(std::deque<cl_int> statuses) { fEventStatuses = std::move(statuses); }
    // What the next glClientWaitSync calls return; without any, that the fence was signalled.
    void scriptClientWaits(std::deque<unsigned> results) { fClientWaits = std::move(results); }
    // The next creation from a renderer's buffer returns this memory object, with one more
    // reference; null: it returns null, with success.
    void scriptNextSharedMem(cl_mem mem) { fNextSharedMem = mem; }
    // The next clCreateKernel returns this living kernel, with one more reference.
    void scriptNextKernel(cl_kernel kernel) { fNextKernel = kernel; }

    // Calls what was given to clCreateContext for errors.
    void raiseContextError(const char* text) { fNotify(text, nullptr, 0, nullptr); }

private:
    friend class Entry;

    struct Plan {
        Fault fault;
        unsigned calls = 0; // of its function, so far
    };

    // Adds a platform or a device to its list.
    template <typename T>
    void add(Kind kind, std::vector<T>& list);
    // Counts a call of `function`; the fault that it meets, or null.
    const Fault* meetFault(const std::string& function);

    QuietLock fLock;
    World fWorld;
    Ledger fLedger;
    CommandOrder fCommands;
    std::vector<Plan> fPlans;
    std::vector<cl_platform_id> fPlatforms; // in the world's order, as the devices
    std::vector<cl_device_id> fDevices;
    std::vector<DeviceScript> fDeviceScripts;
    std::pair<const void*, std::size_t> fHostMemory{};
    std::vector<std::string> fCalls;
    std::vector<std::string> fMisuse;
    std::deque<cl_int> fEventStatuses{CL_COMPLETE};
    std::deque<unsigned> fClientWaits;
    ContextNotify fNotify = nullptr;
    std::optional<cl_mem> fNextSharedMem;
    cl_kernel fNextKernel = nullptr;
};

// The process's one.
FakeRuntime& runtime();

// While it lives, the calling thread is inside the scripted runtime or host: its allocations are
// not the library's.
class InsideRuntime {
public:
    InsideRuntime() { ++depth(); }
    ~InsideRuntime() { --depth(); }
    InsideRuntime(const InsideRuntime&) = delete;
    InsideRuntime& operator=(const InsideRuntime&) = delete;

    static bool here() { return depth() > 0; }

private:
    static int& depth();
};

} // namespace scripted
