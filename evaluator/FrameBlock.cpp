#include "evaluator/FrameBlock.h"

#include "runtime/TopenCLInfo.h"

#include <algorithm>
#include <cstring>

namespace vyra {
namespace {

constexpr std::size_t kElementBytes = 4 * sizeof(float); // of the float4 that kernels index

std::size_t roundUp(std::size_t bytes)
{
    return (bytes + kElementBytes - 1) / kElementBytes * kElementBytes;
}

} // namespace

FrameBlock::FrameBlock() : fDevice(TopenCLInfo::theOne().openCLContext(), CL_MEM_READ_ONLY)
{
    fDevice.openCLDataBuffer().descriptor().setPermissions(TopenCLDataBufferDescriptor::kReadWrite);
}

FrameBlock::~FrameBlock()
{
    fDevice.ensureBufferCapacity(0); // only waits
}

void FrameBlock::begin()
{
    fEnd = 0;
    fChangedBegin = fChangedEnd = 0;
}

cl_uint FrameBlock::append(const void* bytes, std::size_t sizeInBytes)
{
    const std::size_t begin = fEnd;
    const std::size_t end = begin + roundUp(sizeInBytes);
    if (end > fHost.size() ||
        (sizeInBytes && std::memcmp(fHost.data() + begin, bytes, sizeInBytes) != 0))
        change(begin, end, bytes, sizeInBytes);
    fEnd = end; // if there is no memory for the bytes, they are not appended
    return static_cast<cl_uint>(begin / kElementBytes);
}

void FrameBlock::change(std::size_t begin, std::size_t end, const void* bytes,
                        std::size_t sizeInBytes)
{
    if (fUploadPending) {
        fDevice.ensureBufferCapacity(0);
        fUploadPending = false;
    }
    if (end > fHost.size())
        fHost.resize(std::max(end, 2 * fHost.size()));
    if (sizeInBytes)
        std::memcpy(fHost.data() + begin, bytes, sizeInBytes);
    fChangedBegin = fChangedBegin == fChangedEnd ? begin : std::min(fChangedBegin, begin);
    fChangedEnd = begin + sizeInBytes;
}

cl_int FrameBlock::upload(cl_command_queue queue, AutoCLObject<cl_event>& event)
{
    if (fDevice.capacityInBytes() < fHost.size()) {
        const cl_int status = fDevice.ensureBufferCapacity(fHost.size());
        if (status != CL_SUCCESS)
            return status;
        fChangedBegin = 0;
        fChangedEnd = fEnd;
    }
    if (fChangedBegin == fChangedEnd)
        return CL_SUCCESS;
    const cl_int status =
        fDevice.uploadDataToGPU(queue, CL_FALSE, fChangedBegin, fChangedEnd - fChangedBegin,
                                fHost.data() + fChangedBegin, 0, nullptr);
    if (status != CL_SUCCESS) {
        // Host and device contents differ: the next evaluation uploads all bytes.
        fHost.clear();
        return status;
    }
    fUploadPending = true;
    event = fDevice.bufferReadyEvent();
    return CL_SUCCESS;
}

} // namespace vyra
