#include "tools/info/selftest/SelfTestEvaluation.h"

#include "host/EvaluationId.h"
#include "runtime/TopenCLInfo.h"

#include <memory>
#include <utility>

#include <QOpenGLExtraFunctions>

namespace info {
namespace {

// Returns small whole numbers, which floats represent exactly, different in each evaluation.
std::vector<vyra::Vector3> inputOf(int index, std::size_t vertexCount)
{
    constexpr std::size_t kDifferent = 1000;
    const auto number = [index](std::size_t i) {
        return static_cast<float>((i + static_cast<std::size_t>(index)) % kDifferent);
    };
    std::vector<vyra::Vector3> values;
    for (std::size_t i = 0; i < vertexCount; ++i)
        values.push_back({number(3 * i), number(3 * i + 1), number(3 * i + 2)});
    return values;
}

vyra::EvaluatorSettings settingsFor(QOpenGLExtraFunctions& gl)
{
    vyra::EvaluatorSettings settings;
    settings.finishRenderer = [&gl] { gl.glFinish(); };
    settings.flushRenderer = [&gl] { gl.glFlush(); };
    return settings;
}

std::shared_ptr<const vyra::MeshGeometry> geometryOf(std::size_t vertexCount)
{
    auto geometry = std::make_shared<vyra::MeshGeometry>();
    geometry->name = "self-test";
    geometry->rest.positions.resize(vertexCount);
    geometry->rest.normals.resize(vertexCount);
    return geometry;
}

std::size_t countWrong(const std::vector<vyra::Vector3>& input,
                       const std::vector<vyra::Vector3>& output, float offset)
{
    std::size_t wrong = 0;
    for (std::size_t i = 0; i < input.size(); ++i) {
        const auto isWrong = [offset](float in, float out) {
            return out != SelfTestDeformer::result(in, offset) ? 1U : 0U;
        };
        wrong += isWrong(input[i].x, output[i].x) + isWrong(input[i].y, output[i].y) +
                 isWrong(input[i].z, output[i].z);
    }
    return wrong;
}

} // namespace

SelfTestEvaluation::SelfTestEvaluation(QOpenGLExtraFunctions& gl, std::size_t vertexCount,
                                       std::string kernelText)
    : fGL(gl), fPositions(gl, vertexCount), fNormals(gl, vertexCount), fEvaluator(settingsFor(gl)),
      fVertexCount(vertexCount)
{
    vyra::DeformableMesh& mesh =
        fEvaluator.createMesh(geometryOf(vertexCount), {fPositions.name(), fNormals.name()});
    fDeformer = &mesh.add<SelfTestDeformer>(std::move(kernelText));
}

void SelfTestEvaluation::prepare()
{
    check(fEvaluator.prepare());
}

EvaluationTimes SelfTestEvaluation::run(int index, bool inStages)
{
    EvaluationTimes times;
    const std::vector<vyra::Vector3> input = inputOf(index, fVertexCount);
    fPositions.write(input);
    fNormals.write(input);
    fEvaluator.renderingComplete();
    fDeformer->offset = static_cast<float>(index + 1);
    ++fEvaluationId;

    const Stopwatch whole;
    if (inStages)
        evaluateInStages(times);
    else
        fEvaluator.evaluate(em::Id(fEvaluationId));
    check(fEvaluator.status());
    fEvaluator.waitUntilDrawable();
    const Stopwatch reading;
    const std::vector<vyra::Vector3> positions = fPositions.read();
    const std::vector<vyra::Vector3> normals = fNormals.read();
    times.read = reading.milliseconds();
    times.whole = whole.milliseconds();
    if (fProblem.empty())
        compare(input, positions, normals);
    return times;
}

// Makes the calls of Evaluator::evaluate, with a wait after each stage.
void SelfTestEvaluation::evaluateInStages(EvaluationTimes& times)
{
    TopenCLSharedBufferMgr& manager = TopenCLInfo::theOne().sharedBufferMgr();
    const em::Id id(fEvaluationId);
    if (TopenCLInfo::theOne().useGLFinish())
        fGL.glFinish();
    const Stopwatch acquire;
    manager.PreEvaluate(id);
    TopenCLInfo::finish();
    times.acquire = acquire.milliseconds();

    const Stopwatch kernel;
    fEvaluator.deform();
    fEvaluator.finish();
    times.kernel = kernel.milliseconds();

    const Stopwatch release;
    manager.PostEvaluate(id);
    TopenCLInfo::finish();
    times.release = release.milliseconds();
}

void SelfTestEvaluation::check(const vyra::Status& status)
{
    if (status.ok() || !fProblem.empty())
        return;
    fProblem = status.message;
    fStatus = status.openCL;
}

void SelfTestEvaluation::compare(const std::vector<vyra::Vector3>& input,
                                 const std::vector<vyra::Vector3>& positions,
                                 const std::vector<vyra::Vector3>& normals)
{
    if (positions.empty() || normals.empty()) {
        fProblem = "OpenGL cannot map the vertex buffer for reading";
        return;
    }
    const std::size_t wrong = countWrong(input, positions, fDeformer->offset) +
                              countWrong(input, normals, fDeformer->offset);
    if (wrong > 0)
        fProblem = std::to_string(wrong) + " of " + std::to_string(6 * input.size()) +
                   " numbers in OpenGL's memory are wrong in evaluation " +
                   std::to_string(fEvaluationId);
}

} // namespace info
