#include "LibraryTest.h"

#include "host/Tstring.h"
#include "kernels/TopenCLKernelStore.h"
#include "runtime/TopenCLInfo.h"
#include "standalone/NativeContext.h"
#include "tests/support/KeepModulesLoaded.h"

#include <cstdlib>

void LibraryTest::start(std::initializer_list<Variable> environment)
{
    // No PCI vendor id belongs to this platform's vendor.
    setenv("VYRA_OPENCL_PLATFORM", "The pocl project", 0);
    for (const Variable& variable : environment) {
        if (variable.value)
            setenv(variable.name, variable.value, 1);
        else
            unsetenv(variable.name);
    }
    static int argumentCount = 1;
    static char programName[] = "vyra-opencl-tests";
    static char* arguments[] = {programName, nullptr};
    fApplication = std::make_unique<QGuiApplication>(argumentCount, arguments);
    fSurface = std::make_unique<QOffscreenSurface>();
    fSurface->create();
    fContext = std::make_unique<QOpenGLContext>();
    if (!fContext->create() || !fContext->makeCurrent(fSurface.get()))
        GTEST_SKIP() << "no OpenGL context can be made on this display";
    fHost = std::make_unique<GLHost>(*fContext);
    ASSERT_TRUE(
        TopenCLInfo::initialize(nullptr, nativeContext(*fContext), nullptr, false, false, 0));
}

LibraryTest::~LibraryTest()
{
    if (TopenCLInfo::isValid())
        TopenCLInfo::finish();
    keepModulesLoaded();
}

unsigned LibraryTest::makeGLBuffer(const std::vector<float>& values)
{
    unsigned name = 0;
    gl().glGenBuffers(1, &name);
    gl().glBindBuffer(GL_ARRAY_BUFFER, name);
    gl().glBufferData(GL_ARRAY_BUFFER, static_cast<GLsizeiptr>(values.size() * sizeof(float)),
                      values.data(), GL_DYNAMIC_DRAW);
    return name;
}

std::vector<float> LibraryTest::readGLBuffer(unsigned name, std::size_t count)
{
    std::vector<float> values(count);
    const auto bytes = static_cast<GLsizeiptr>(count * sizeof(float));
    gl().glBindBuffer(GL_ARRAY_BUFFER, name);
    if (const void* mapped = gl().glMapBufferRange(GL_ARRAY_BUFFER, 0, bytes, GL_MAP_READ_BIT)) {
        std::copy_n(static_cast<const float*>(mapped), count, values.begin());
        gl().glUnmapBuffer(GL_ARRAY_BUFFER);
    }
    return values;
}

std::string LibraryTest::kernelPath(const char* fileName)
{
    return std::string(VYRA_TEST_KERNELS "/") + fileName;
}

AutoCLObject<cl_kernel> LibraryTest::deformKernel(const char* name)
{
    return TopenCLInfo::theOne().kernelStore().getKernel(kernelPath("deform.cl").c_str(), nullptr,
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
