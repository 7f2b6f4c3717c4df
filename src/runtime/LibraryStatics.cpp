// Every static object of the library that needs a constructor, in the order of construction;
// unloading destroys them in reverse order. They are in one file because the order across files is
// undefined.
#include "buffers/TopenCLData.h"
#include "buffers/TopenCLDataBuffer.h"
#include "buffers/TopenCLDataBufferDescriptor.h"
#include "host/Trace.h"
#include "interop/ProfilerScope.h"

const TuniqueString TopenCLData::sfPositionsName("positions");
const TuniqueString TopenCLData::sfNormalsName("normals");
const TuniqueString TopenCLData::sfGeometryMatrixName("geometryMatrix");
const TuniqueString TopenCLData::sfInverseGeometryMatrixName("inverseGeometryMatrix");
const TuniqueString TopenCLData::sfNormalIdxToPositionIdxName("normalIdxToPositionIdx");

// Before the null data buffer, which copies this name.
const TuniqueString TopenCLDataBufferDescriptor::sfEmptyName("");
const TopenCLDataBuffer TopenCLDataBuffer::fsNULL;

namespace {

// Registered for developers' traces of the kernel store; nothing writes to it.
const TdbTrace kKernelTrace(1, "clKernel", TdebugOutput::sCerr(),
                            "Errors and warnings from the OpenCL Kernel Store");

} // namespace

const profiler::EventType
    sfAcquireBatchEventType(profiler::categories().main(), profiler::Colors::kColor14,
                            "GPUOverrideAcquireQuorSharedBufferBatch",
                            "Acquiring the quorview shared buffer from the OpenCl buffer manager");
const profiler::EventType
    sfReleaseBatchEventType(profiler::categories().main(), profiler::Colors::kColor14,
                            "GPUOverrideReleaseQuorSharedBufferBatch",
                            "Releasing the quorview shared buffer from the OpenCl buffer manager");
