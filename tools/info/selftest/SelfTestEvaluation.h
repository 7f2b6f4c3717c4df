// The evaluations of the self-test.
#pragma once

#include "evaluator/Evaluator.h"
#include "tools/info/selftest/RendererVertices.h"
#include "tools/info/selftest/SelfTestDeformer.h"

#include <chrono>
#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

class QOpenGLExtraFunctions;

namespace info {

// Measures the time since its construction.
class Stopwatch {
public:
    double milliseconds() const noexcept
    {
        return std::chrono::duration<double, std::milli>(std::chrono::steady_clock::now() - fStart)
            .count();
    }

private:
    std::chrono::steady_clock::time_point fStart = std::chrono::steady_clock::now();
};

// In milliseconds. The times of the stages are 0 unless each stage is waited for.
struct EvaluationTimes {
    double whole = 0; // until OpenGL has read the result
    double acquire = 0;
    double kernel = 0;
    double release = 0;
    double read = 0;
};

// A mesh with two vertex buffers that OpenGL writes, OpenCL deforms and OpenGL reads. Keeps the
// first problem; run() must not be called after one. The OpenGL context is current during each
// operation.
class SelfTestEvaluation {
public:
    SelfTestEvaluation(QOpenGLExtraFunctions& gl, std::size_t vertexCount, std::string kernelText);

    // Builds the kernel and shares the vertex buffers.
    void prepare();

    // Runs one evaluation on numbers that depend on `index`, and compares the result. Waits after
    // each stage if `inStages` is set.
    EvaluationTimes run(int index, bool inStages);

    // Returns the first problem. Empty if there is none.
    const std::string& problem() const noexcept { return fProblem; }
    int status() const noexcept { return fStatus; }

private:
    void evaluateInStages(EvaluationTimes& times);
    void check(const vyra::Status& status);
    void compare(const std::vector<vyra::Vector3>& input,
                 const std::vector<vyra::Vector3>& positions,
                 const std::vector<vyra::Vector3>& normals);

    QOpenGLExtraFunctions& fGL;
    RendererVertices fPositions;
    RendererVertices fNormals;
    vyra::Evaluator fEvaluator; // destroyed before the vertex buffers
    SelfTestDeformer* fDeformer = nullptr;
    std::size_t fVertexCount;
    std::uint16_t fEvaluationId = 0;
    std::string fProblem;
    int fStatus = 0;
};

} // namespace info
