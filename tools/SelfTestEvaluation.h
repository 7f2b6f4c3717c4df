// One evaluation of the self-test, as a host and its deformer make it.
#pragma once

#include "diagnostics/AutoCLObject.h"
#include "runtime/TopenCLInfo.h"
#include "tools/OpenCLCalls.h"
#include "tools/SharedVertices.h"

#include <chrono>
#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

namespace info {

// Runs from its construction on.
class Stopwatch {
public:
    double milliseconds() const
    {
        return std::chrono::duration<double, std::milli>(std::chrono::steady_clock::now() - fStart)
            .count();
    }

private:
    std::chrono::steady_clock::time_point fStart = std::chrono::steady_clock::now();
};

// In milliseconds. The stages are measured only where there is a wait behind each.
struct EvaluationTimes {
    double whole = 0; // until OpenGL has read the result
    double acquire = 0;
    double kernel = 0;
    double release = 0;
    double read = 0;
};

// Borrows the vertices and the kernel. The first problem stays; nothing is to be run after it.
class SelfTestEvaluation {
public:
    SelfTestEvaluation(SharedVertices& vertices, cl_kernel kernel, std::size_t floats);

    // OpenGL writes numbers that belong to `index`, OpenCL deforms them, OpenGL reads and compares
    // them. `inStages` waits behind each stage.
    EvaluationTimes run(int index, bool inStages);

    // Empty while all is right.
    const std::string& problem() const { return fProblem; }
    int status() const { return fStatus; }

private:
    bool evaluate(float offset, bool inStages, EvaluationTimes& times);
    AutoCLObject<cl_event> acquire();
    AutoCLObject<cl_event> enqueueKernel(float offset, cl_event acquired);
    AutoCLObject<cl_event> release(cl_event deformed);
    void waitAsTheHostDoes(cl_event released);
    void compare(const std::vector<float>& input, const std::vector<float>& output, float offset);
    bool succeeded(int status, const char* what);
    bool waitFor(cl_event event);

    SharedVertices& fVertices;
    cl_kernel fKernel;
    std::size_t fFloats;
    OpenCLCalls fCalls = findOpenCLCalls();
    std::uint16_t fEvaluationId = 0;
    std::string fProblem;
    int fStatus = CL_SUCCESS;
};

} // namespace info
