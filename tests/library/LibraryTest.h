// A renderer, and the library initialised on it.
#pragma once

#include "Renderer.h"
#include "diagnostics/AutoCLObject.h"
#include "interop/TopenCLSharedBufferMgr.h"

#include <initializer_list>
#include <memory>
#include <utility>
#include <vector>

#include <gtest/gtest.h>

using Variable = std::pair<const char*, const char*>; // of the environment: name and value

// The runtime object lives once per process, so each test is a process of its own.
class LibraryTest : public testing::Test {
protected:
    void SetUp() override { start(); }
    // Sets the variables and initialises the library; a null value removes the variable. Skips the
    // test when the machine has no OpenGL; a runtime that cannot be initialised fails it.
    void start(std::initializer_list<Variable> environment = {});
    // Sets VYRA_OPENCL_PLATFORM, if it is not set, to the vendor of the first platform: no PCI
    // vendor id belongs to the software runtimes.
    static void chooseFirstPlatform();
    ~LibraryTest() override;

    Renderer& renderer() { return *fRenderer; }
    static TopenCLSharedBufferMgr& manager();

    // The kernel `name` of kernels/deform.cl.
    static AutoCLObject<cl_kernel> deformKernel(const char* name);

private:
    std::unique_ptr<Renderer> fRenderer;
};

// Enqueues `kernel` over `count` floats of `memory` with the argument `amount`, sized with
// getWorkGroupSizes, after `waitList`. Returns the command's event.
AutoCLObject<cl_event> enqueueDeform(cl_command_queue queue, cl_kernel kernel, cl_mem memory,
                                     float amount, std::size_t count,
                                     const std::vector<cl_event>& waitList);
