// A hidden OpenGL context, the stand-in host around it, and the library initialised on both.
#pragma once

#include "diagnostics/AutoCLObject.h"
#include "standalone/GLHost.h"

#include <initializer_list>
#include <memory>
#include <string>
#include <vector>

#include <QGuiApplication>
#include <QOffscreenSurface>
#include <QOpenGLContext>
#include <QOpenGLExtraFunctions>
#include <gtest/gtest.h>

struct Variable {
    const char* name;
    const char* value;
};

// The runtime object lives once per process, so each test is a process of its own.
class LibraryTest : public testing::Test {
protected:
    // Sets the variables and initialises the library; a null value removes the variable. Skips the
    // test when the machine has no OpenGL; a runtime that cannot be initialised fails it.
    void start(std::initializer_list<Variable> environment = {});
    ~LibraryTest() override;

    QOpenGLExtraFunctions& gl() { return *fContext->extraFunctions(); }

    // A buffer of the renderer that holds `values`, and what one holds.
    unsigned makeGLBuffer(const std::vector<float>& values);
    std::vector<float> readGLBuffer(unsigned name, std::size_t count);

    // The kernel `name` of kernels/deform.cl.
    static AutoCLObject<cl_kernel> deformKernel(const char* name);
    static std::string kernelPath(const char* fileName);

private:
    // The first members go last: the application outlives everything of Qt's.
    std::unique_ptr<QGuiApplication> fApplication;
    std::unique_ptr<QOffscreenSurface> fSurface;
    std::unique_ptr<QOpenGLContext> fContext;
    std::unique_ptr<GLHost> fHost;
};

// Enqueues `kernel` over `count` floats of `memory` with the argument `amount`, sized with
// getWorkGroupSizes, after `waitList`. Returns the command's event.
AutoCLObject<cl_event> enqueueDeform(cl_command_queue queue, cl_kernel kernel, cl_mem memory,
                                     float amount, std::size_t count,
                                     const std::vector<cl_event>& waitList);
