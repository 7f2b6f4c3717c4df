// One evaluation of the self-test.
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

// In milliseconds. The stages are measured only if each is waited for.
struct EvaluationTimes {
    double whole = 0; // until OpenGL has read the result
    double acquire = 0;
    double kernel = 0;
    double release = 0;
    double read = 0;
};

// A mesh with two vertex buffers that OpenGL writes, OpenCL deforms and OpenGL reads. The first
// problem stays; nothing is to be run after it. The renderer's context is current during each
// operation.
class SelfTestEvaluation {
public:
    SelfTestEvaluation(QOpenGLExtraFunctions& gl, std::size_t vertexCount, std::string kernelText);

    // Builds the kernel and shares the vertex buffers.
    void prepare();

    // OpenGL writes numbers that depend on `index`, OpenCL deforms them, OpenGL reads and compares
    // them. `inStages` waits for each stage.
    EvaluationTimes run(int index, bool inStages);

    // Empty as long as all is right.
    const std::string& problem() const { return fProblem; }
    int status() const { return fStatus; }

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
