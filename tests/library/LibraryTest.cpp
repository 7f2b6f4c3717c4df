#include "LibraryTest.h"

#include "Platform.h"
#include "host/Tstring.h"
#include "kernels/TopenCLKernelStore.h"
#include "runtime/TopenCLInfo.h"

#include <array>
#include <cstdlib>

void LibraryTest::chooseFirstPlatform()
{
    if (std::getenv("VYRA_OPENCL_PLATFORM"))
        return;
    cl_platform_id platform = nullptr;
    std::array<char, 256> vendor{};
    ASSERT_EQ(clGetPlatformIDs(1, &platform, nullptr), CL_SUCCESS);
    ASSERT_EQ(
        clGetPlatformInfo(platform, CL_PLATFORM_VENDOR, vendor.size(), vendor.data(), nullptr),
        CL_SUCCESS);
    setEnvironment("VYRA_OPENCL_PLATFORM", vendor.data());
}

void LibraryTest::start(std::initializer_list<Variable> environment)
{
    ASSERT_NO_FATAL_FAILURE(chooseFirstPlatform());
    for (const auto& [name, value] : environment)
        setEnvironment(name, value);
    fRenderer = Renderer::make();
    if (!fRenderer)
        GTEST_SKIP() << "this display has no OpenGL";
    ASSERT_TRUE(TopenCLInfo::initialize(fRenderer->window(), fRenderer->context(), nullptr, false,
                                        false, 0));
}

LibraryTest::~LibraryTest()
{
    if (TopenCLInfo::isValid())
        TopenCLInfo::finish();
}

TopenCLSharedBufferMgr& LibraryTest::manager()
{
    return TopenCLInfo::theOne().sharedBufferMgr();
}

AutoCLObject<cl_kernel> LibraryTest::deformKernel(const char* name)
{
    return TopenCLInfo::theOne().kernelStore().getKernel(VYRA_TEST_KERNELS "/deform.cl", nullptr,
                                                         name, nullptr);
}

AutoCLObject<cl_event> enqueueDeform(cl_command_queue queue, cl_kernel kernel, cl_mem memory,
                                     float amount, std::size_t count,
                                     const std::vector<cl_event>& waitList)
{
    const auto elements = static_cast<cl_uint>(count);
    EXPECT_EQ(clSetKernelArg(kernel, 0, sizeof memory, &memory), CL_SUCCESS);
    EXPECT_EQ(clSetKernelArg(kernel, 1, sizeof amount, &amount), CL_SUCCESS);
    EXPECT_EQ(clSetKernelArg(kernel, 2, sizeof elements, &elements), CL_SUCCESS);

    std::size_t global = 0;
    std::size_t local = 0;
    EXPECT_EQ(TopenCLInfo::theOne().getWorkGroupSizes(kernel, count, global, local), CL_SUCCESS);
    AutoCLObject<cl_event> done;
    EXPECT_EQ(clEnqueueNDRangeKernel(queue, kernel, 1, nullptr, &global, &local,
                                     static_cast<cl_uint>(waitList.size()),
                                     waitList.empty() ? nullptr : waitList.data(), done.receive()),
              CL_SUCCESS);
    return done;
}
