// The scripted OpenCL runtime that implements the entry points, for a test to set and to read.
//
// The entry points live in a shared library that has the name of the OpenCL library. The tests'
// executables are linked to it, so it is in the process already when the code under test opens
// OpenCL by name, and the loader returns it. Extension entry points are not exported: they are
// found only through clGetExtensionFunctionAddress, unless the machine leaves them out.
//
// Any thread may call an entry point. The functions declared here are for the test's own thread,
// while no other thread makes calls.
#pragma once

#include "fake/CommandOrder.h"
#include "fake/Ledger.h"
#include "fake/Machine.h"

#include <atomic>
#include <deque>
#include <string>
#include <utility>
#include <vector>

namespace scripted {

// A spin lock that ThreadSanitizer does not see: the runtime's library is built without it. A mutex
// would order the threads of the code under test and hide their races.
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
    // Removes all objects and creates the platforms and devices of `machine`.
    void describe(const Machine& machine);

    // The calls since the last take, OpenCL's, OpenGL's and the host's in one order, each as text:
    //     clEnqueueWriteBuffer(queue#1, mem#2, 0, 16, 64, host+16, [event#1]) = event#3
    //     clCreateBuffer(context#1, 4, 64, null) ! -4
    //     clEnqueueNDRangeKernel(queue#1, kernel#1, 64, 64, []) on [mem#1, mem#2] = event#4
    // Lists are in brackets; the first form names the created object, the second the status, the
    // third the memory objects in the kernel's arguments.
    std::vector<std::string> takeCalls() { return std::exchange(fCalls, {}); }
    // Adds a line of the host to the same log.
    void log(std::string line);

    void plan(const Fault& fault) { fPlans.push_back({fault}); }
    void clearFaults() { fPlans.clear(); }

    // Misuse that a validating runtime would reject: "clReleaseEvent: event#1 is dead".
    std::vector<std::string> takeMisuse() { return std::exchange(fMisuse, {}); }

    std::vector<std::string> balance() const { return fLedger.balance(); }
    // Returns the name of an object, "host+OFFSET" for an address in the host memory, else "null"
    // or "ptr".
    std::string name(const void* handle) const;
    // Sets the test's memory that transfers read and write, which the log then names.
    void setHostMemory(const void* begin, std::size_t bytes) { fHostMemory = {begin, bytes}; }
    void forgetDead() { fLedger.forgetDead(); }
    unsigned created(Kind kind) const { return fLedger.created(kind); }
    // Returns the references of an existing object, else 0.
    unsigned references(Kind kind, const void* handle);

    // Returns the names of the acquired shared buffers.
    std::vector<std::string> acquired() const { return fLedger.acquired(); }
    // Sets whether commands stay incomplete until the host waits for them, or until
    // completeCommands.
    void holdCommands(bool hold) { fCommands.hold(hold); }
    void completeCommands() { fCommands.completeAll(); }

    // Sets the statuses that queries of every later event return, in order; the last one repeats.
    // The default is one CL_COMPLETE. Waiting for an event completes it.
    void scriptEventStatuses(std::deque<cl_int> statuses) { fEventStatuses = std::move(statuses); }
    // Sets the results of the next glClientWaitSync calls; without any, the fence is signalled.
    void scriptClientWaits(std::deque<unsigned> results) { fClientWaits = std::move(results); }
    // Makes the next creation of a shared buffer return this memory object, with one more
    // reference; if null, it returns null with success.
    void scriptNextSharedMem(cl_mem mem) { fNextSharedMem = mem; }
    // Makes the next clCreateKernel return this existing kernel, with one more reference.
    void scriptNextKernel(cl_kernel kernel) { fNextKernel = kernel; }

    // Calls the error callback that was passed to clCreateContext.
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
    // Counts a call of `function`. Returns the fault for it, or null.
    const Fault* meetFault(const std::string& function);

    QuietLock fLock;
    Machine fMachine;
    Ledger fLedger;
    CommandOrder fCommands;
    std::vector<Plan> fPlans;
    std::vector<cl_platform_id> fPlatforms; // in the machine's order, as the devices
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

// Returns the runtime of the process.
FakeRuntime& runtime();

// Marks the calling thread as inside the scripted runtime or host: its allocations are not counted
// as the library's.
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
