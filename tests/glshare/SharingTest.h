// What the tests of the layer share: an OpenGL context, current on the test's thread, and an OpenCL
// context and an in-order queue that share with it. The tests run under each setting of the layer's
// switches and ask here which one it is.
#pragma once

#define GL_GLEXT_PROTOTYPES 1

#include "EglTestContext.h"

#include "glshare.h"

#include <CL/cl.h>
#include <CL/cl_gl.h>
#include <GL/gl.h>
#include <GL/glext.h>
#include <gtest/gtest.h>

#include <cstddef>
#include <functional>
#include <memory>
#include <string>
#include <vector>

using Numbers = std::vector<cl_int>;

// `count` numbers from `first` on.
Numbers numbersFrom(cl_int first, std::size_t count);

class SharingTest : public testing::Test {
protected:
    void SetUp() override;
    void TearDown() override;

    // Whether a switch of the layer is on.
    static bool isOn(const char* variable);
    static bool offersGlEvent() { return isOn("GLSHARE_GL_EVENT"); }
    static bool isZeroCopy() { return isOn("GLSHARE_ZERO_COPY"); }

    static std::string extensionsOf(cl_platform_id platform);
    static glshare_counters counters();

    [[nodiscard]] std::vector<cl_context_properties> properties(const EglTestContext& gl) const;

    // A GL buffer with these numbers, and an OpenCL object over it.
    static GLuint makeGlBuffer(const Numbers& numbers);
    static Numbers readGl(GLuint buffer, std::size_t count);
    cl_mem share(GLuint buffer, cl_mem_flags flags = CL_MEM_READ_WRITE);

    cl_int acquire(cl_mem memory, const std::vector<cl_event>& waitList = {},
                   cl_event* event = nullptr);
    cl_int release(cl_mem memory, const std::vector<cl_event>& waitList = {},
                   cl_event* event = nullptr);

    // Through the queue; both wait.
    Numbers readCl(cl_mem memory, std::size_t count);
    void writeCl(cl_mem memory, const Numbers& numbers);

    static cl_int statusOf(cl_event event);

    // Runs on a thread of its own, which has no OpenGL context, and waits for it.
    static void onOtherThread(const std::function<void()>& work);

    std::unique_ptr<EglTestContext> gl_;
    cl_platform_id platform_ = nullptr;
    cl_device_id device_ = nullptr;
    cl_context context_ = nullptr;
    cl_command_queue queue_ = nullptr;
};
