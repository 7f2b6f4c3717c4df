// Takes the place of the sharing extension, so that only the library's own share is left.
#pragma once

#include "runtime/InteropFunctions.h"

#include <cstddef>
#include <memory>

#include <CL/cl.h>

// While an object lives, the library's acquires and releases are answered with a complete event at
// once, and its creations with a further reference to the memory object that `resource` points to.
// One at a time.
class InteropStub {
public:
    InteropStub();
    ~InteropStub();
    InteropStub(const InteropStub&) = delete;
    InteropStub& operator=(const InteropStub&) = delete;

private:
    CreateSharedCLBuffer fCreate;
    EnqueueSharedObjects fAcquire;
    EnqueueSharedObjects fRelease;
};

// While an object lives, counts the library's acquire and release calls on their way. One at a
// time.
class InteropCounter {
public:
    InteropCounter();
    ~InteropCounter();
    InteropCounter(const InteropCounter&) = delete;
    InteropCounter& operator=(const InteropCounter&) = delete;

    static std::size_t acquires();
    static std::size_t releases();
};
