#include "viewer/DeformerChain.h"

namespace viewer {
namespace {

// The attributes of a mesh's node in the host's graph.
enum Attribute : std::uint64_t { kRest, kSkinned, kTwisted };

} // namespace

DeformerChain::DeformerChain(const OpenCLFunctions& cl, std::uint64_t number, bool hasBones,
                             KernelFiles& files)
    : fRest(number, kRest), fSkinned(number, hasBones ? kSkinned : kRest),
      fTwisted(number, kTwisted), fRestPositions(TopenCLData::sPositionsName(), fRest),
      fRestNormals(TopenCLData::sNormalsName(), fRest),
      fTwist(cl, DeformerPlugs{fSkinned, fTwisted}, files)
{
    if (hasBones)
        fSkin.emplace(cl, DeformerPlugs{fRest, fSkinned}, files);
}

bool DeformerChain::valid() const
{
    return fTwist.valid() && (!fSkin || fSkin->valid());
}

void DeformerChain::renewKernels(KernelFiles& files)
{
    fTwist.renewKernel(files);
    if (fSkin)
        fSkin->renewKernel(files);
}

cl_int DeformerChain::setMesh(const Mesh& mesh, cl_command_queue queue,
                              const AutoCLEventList& lastUse)
{
    cl_int status = fRestPositions.writeConstant(queue, mesh.positions, lastUse);
    if (status == CL_SUCCESS)
        status = fRestNormals.writeConstant(queue, mesh.normals, lastUse);
    if (status == CL_SUCCESS && fSkin)
        status = fSkin->setMesh(mesh, queue, lastUse);
    fData.setData(TopenCLData::sPositionsName(), fRest, fRestPositions.data());
    fData.setData(TopenCLData::sNormalsName(), fRest, fRestNormals.data());
    return status;
}

cl_int DeformerChain::evaluate(const MeshPose& pose, WorkerQueue& worker,
                               const AutoCLEventList& lastUse)
{
    if (!pose.deforms) {
        passThrough();
        return CL_SUCCESS;
    }
    if (fSkin) {
        const cl_int status = fSkin->evaluate(pose.bones, worker, lastUse, fData);
        if (status != CL_SUCCESS)
            return status;
    }
    return fTwist.evaluate(pose, worker, lastUse, fData);
}

// Deformers that are off: what goes into the chain comes out of it.
void DeformerChain::passThrough()
{
    fData.setData(TopenCLData::sPositionsName(), fTwisted, fRestPositions.data());
    fData.setData(TopenCLData::sNormalsName(), fTwisted, fRestNormals.data());
}

const TopenCLDataBuffer& DeformerChain::output(const TuniqueString& name) const
{
    return fData.getData(name, fTwisted);
}

} // namespace viewer
