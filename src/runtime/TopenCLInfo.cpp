#include "runtime/TopenCLInfo.h"

#include "runtime/EnvironmentVariables.h"

#include <algorithm>
#include <cstdio>
#include <cstdlib>

namespace {

// Vertices.
constexpr int kMinimumBufferSizeOnNVIDIA = 2000;
constexpr int kMinimumBufferSizeElsewhere = 500;

} // namespace

constinit TopenCLInfo* TopenCLInfo::sfTheOne = nullptr;

TopenCLInfo& TopenCLInfo::theOne()
{
    return *sfTheOne;
}

bool TopenCLInfo::isValid()
{
    return sfTheOne && sfTheOne->fContext && sfTheOne->fCommandQueue;
}

TopenCLInfo::TopenCLInfo(const TopenCLInfo& other) = default;
TopenCLInfo& TopenCLInfo::operator=(const TopenCLInfo& other) = default;

int TopenCLInfo::getDefaultMinimumBufferSize() const
{
    if (const char* value = std::getenv(kMinimumVerticesVariable)) {
        const int vertices = std::max(std::atoi(value), 0);
        std::fprintf(stderr,
                     "OpenCL evaluator detected VYRA_OPENCL_DEFORMER_MIN_VERTS defined to %d.\n",
                     vertices);
        return vertices;
    }
    return fProvider == kNVIDIAProvider ? kMinimumBufferSizeOnNVIDIA : kMinimumBufferSizeElsewhere;
}

bool TopenCLInfo::setMinimumBufferSize(int size)
{
    const int newSize = size < 0 ? getDefaultMinimumBufferSize() : size;
    if (newSize == fMinimumBufferSize)
        return false;
    fMinimumBufferSize = newSize;
    return true;
}

bool TopenCLInfo::setUseMinimumBufferSize(bool use)
{
    if (use == fUseMinimumBufferSize)
        return false;
    fUseMinimumBufferSize = use;
    return true;
}

bool TopenCLInfo::setAllowDoublePrecisionSupport(bool allow)
{
    const bool allowed = fPlatformSupportsDoublePrecision && allow;
    if (allowed == fAllowDoublePrecisionSupport)
        return false;
    fAllowDoublePrecisionSupport = allowed;
    return true;
}
