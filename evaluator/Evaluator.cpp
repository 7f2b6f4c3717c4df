#include "evaluator/Evaluator.h"

#include "evaluator/EvaluatorImplementation.h"

#include "bridge/IDeformerEvaluatorBridge.h"
#include "host/EvaluationId.h"
#include "runtime/TopenCLInfo.h"

#include <utility>

namespace vyra {

Evaluator::Evaluator(EvaluatorSettings settings)
    : fImplementation(std::make_unique<EvaluatorImplementation>(std::move(settings)))
{
}

Evaluator::~Evaluator()
{
    if (IDeformerEvaluatorBridge::getAPI() == this)
        IDeformerEvaluatorBridge::setAPI(nullptr);
}

DeformableMesh& Evaluator::createMesh(std::shared_ptr<const MeshGeometry> geometry,
                                      const VertexBuffers& buffers)
{
    auto state = std::make_unique<MeshState>();
    if (!geometry) {
        state->creation = Status("it has no geometry");
        geometry = std::make_shared<MeshGeometry>();
    }
    std::unique_ptr<DeformableMesh> mesh(new DeformableMesh(std::move(geometry), std::move(state)));
    return fImplementation->add(std::move(mesh), buffers);
}

void Evaluator::destroyMesh(DeformableMesh& mesh)
{
    fImplementation->remove(mesh);
}

Status Evaluator::prepare()
{
    return fImplementation->prepare();
}

void Evaluator::evaluate(const em::Id& id)
{
    fImplementation->evaluate(id);
}

const Status& Evaluator::deform()
{
    fImplementation->deform();
    return fImplementation->status();
}

void Evaluator::waitUntilDrawable()
{
    fImplementation->waitUntilDrawable();
}

void Evaluator::renderingComplete()
{
    fImplementation->renderingComplete();
}

void Evaluator::finish()
{
    fImplementation->finish();
}

const Status& Evaluator::status() const
{
    return fImplementation->status();
}

bool Evaluator::usesOpenCL() const
{
    return fImplementation->usesOpenCL();
}

Status Evaluator::replaceKernelFile(const std::string& file, const std::string& source)
{
    return fImplementation->replaceKernelFile(file, source);
}

std::string Evaluator::kernelDirectory()
{
    return std::string(TopenCLInfo::theOne().getAbsolutePathToResources().asChar()) + "/kernels";
}

EvaluatorCounts Evaluator::counts() const
{
    return fImplementation->counts();
}

std::size_t Evaluator::batchSize() const
{
    return fImplementation->batchSize();
}

} // namespace vyra
