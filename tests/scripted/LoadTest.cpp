// The shared library, loaded and unloaded: the order in which its static objects are constructed
// and destroyed.
#include "Platform.h"
#include "fake/FakeRuntime.h"

#include <gtest/gtest.h>

TEST(Load, LoadingConstructsStaticObjectsAndUnloadingDestroysInReverse)
{
    using Initialize = bool(void*, void*, void*, bool, bool, unsigned);
    using Lines = std::vector<std::string>;
    scripted::FakeRuntime& runtime = scripted::runtime();
    runtime.describe({});

    void* library = loadLibrary(VYRA_OPENCL_LIBRARY);
    ASSERT_NE(library, nullptr);
    EXPECT_EQ(
        runtime.takeCalls(),
        (Lines{"name \"positions\"", "name \"normals\"", "name \"geometryMatrix\"",
               "name \"inverseGeometryMatrix\"", "name \"normalIdxToPositionIdx\"", "name \"\"",
               "trace 1 clKernel: Errors and warnings from the OpenCL Kernel Store",
               "event type GPUOverrideAcquireQuorSharedBufferBatch",
               "event type GPUOverrideReleaseQuorSharedBufferBatch"}));

    // Destroying the null buffer makes no call.
    auto* initialize = reinterpret_cast<Initialize*>(
        symbolOf(library, "_ZN11TopenCLInfo10initializeEPvS0_S0_bbj"));
    void* null = symbolOf(library, "_ZN17TopenCLDataBuffer6fsNULLE");
    ASSERT_TRUE(initialize && null);
    ASSERT_TRUE(initialize(nullptr, nullptr, nullptr, false, true, 0x8086));
    const cl_context_properties none[] = {0};
    const cl_context context = clCreateContext(none, 0, nullptr, nullptr, nullptr, nullptr);
    *static_cast<cl_mem*>(null) = clCreateBuffer(context, 0, 64, nullptr, nullptr);
    runtime.takeCalls();
    unloadLibrary(library);
    EXPECT_EQ(runtime.takeCalls(),
              (Lines{"trace destroyed: clKernel", "clReleaseMemObject(mem#1)"}));
}
