// The `ocl` module of OpenCV: a program cache, and a pool that UMat uses. It has no wait list.
#include "baselines/AllBaselines.h"
#include "fixtures/Programs.h"
#include "fixtures/Runtime.h"

#include <memory>
#include <stdexcept>

#include <opencv2/core.hpp>
#include <opencv2/core/bufferpool.hpp>
#include <opencv2/core/ocl.hpp>

namespace ocl = cv::ocl;

namespace {

// Binds OpenCV on the calling thread to this library's context and its only device, with a queue of
// OpenCV's own, until destruction.
class Attachment {
public:
    Attachment()
    {
        const ocl::Context context = ocl::Context::fromHandle(Runtime::context());
        // Not Device::fromHandle, whose device version 4.6 does not find in the context.
        ocl::OpenCLExecutionContext::create(context, context.device(0)).bind();
        if (!ocl::useOpenCL())
            throw std::runtime_error("OpenCV does not use this OpenCL device");
    }
    ~Attachment() { ocl::OpenCLExecutionContext::getCurrentRef().release(); }
    Attachment(const Attachment&) = delete;
    Attachment& operator=(const Attachment&) = delete;
};

// Path, source and options are the key. The cache takes include directories as options, so they are
// joined in advance.
class CachedPrograms {
public:
    explicit CachedPrograms(const Programs& programs)
    {
        for (const KernelRequest& request : programs.requests()) {
            fSources.emplace_back("", request.path, Programs::source(), "");
            fOptions.emplace_back(Programs::buildOptions(request));
            if (ocl::Kernel(KernelRequest::kKernelName, fSources.back(), fOptions.back()).empty())
                throw std::runtime_error("OpenCV cannot create a kernel of " + request.path);
        }
    }

    void takeTurns(std::size_t count) const
    {
        for (std::size_t index = 0; index < count; ++index) {
            const std::size_t turn = index % fSources.size();
            keep(ocl::Kernel(KernelRequest::kKernelName, fSources[turn], fOptions[turn]));
        }
    }

private:
    Attachment fAttachment;
    std::vector<ocl::ProgramSource> fSources;
    std::vector<cv::String> fOptions;
};

cv::UMat createMatrix(std::size_t bytes)
{
    return {1, static_cast<int>(bytes), CV_8UC1};
}

// Enables the pool until destruction. It is disabled by default on most devices, and does not keep
// buffers larger than one eighth of its size.
class Pool {
public:
    Pool() : fController(ocl::getOpenCLAllocator()->getBufferPoolController())
    {
        constexpr std::size_t kBytes = std::size_t{1} << 30;
        fController->setMaxReservedSize(kBytes);
    }
    ~Pool() { fController->setMaxReservedSize(0); } // releases all buffers
    Pool(const Pool&) = delete;
    Pool& operator=(const Pool&) = delete;

    bool isEmpty() const { return fController->getReservedSize() == 0; }

private:
    Attachment fAttachment;
    cv::BufferPoolController* fController; // of the attached context
};

class OpenCV : public ThirdPartyBaseline {
public:
    std::string name() const override { return "OpenCV"; }

    std::optional<Case> kernelHits(const Programs& programs) const override
    {
        const auto cached = std::make_shared<CachedPrograms>(programs);
        return Case{"Kernel of a ProgramSource", [cached](std::size_t count) {
                        return timed([&] { cached->takeTurns(count); });
                    }};
    }

    std::optional<Case> bufferReuse(const std::vector<std::size_t>& sizes) const override
    {
        const auto pool = std::make_shared<Pool>();
        Body body = takingBuffers(sizes, [pool](std::size_t bytes) { return createMatrix(bytes); });
        if (pool->isEmpty())
            throw std::runtime_error("OpenCV keeps no buffer in its pool");
        return Case{"UMat, pool", std::move(body)};
    }

    std::optional<Case> writtenReuse(std::size_t bytes,
                                     void (*write)(cl_mem, std::size_t)) const override
    {
        const auto pool = std::make_shared<Pool>();
        return Case{"UMat, pool, write", [pool, bytes, write](std::size_t count) {
                        return timedLoop(count, [&] {
                            const cv::UMat matrix = createMatrix(bytes);
                            write(static_cast<cl_mem>(matrix.handle(cv::ACCESS_WRITE)), bytes);
                        });
                    }};
    }

    std::optional<Case> upload(cl_mem memory, const std::vector<char>& contents) const override
    {
        const auto attachment = std::make_shared<Attachment>();
        const auto bytes = static_cast<int>(contents.size());
        cv::UMat matrix;
        ocl::convertFromBuffer(memory, contents.size(), 1, bytes, CV_8UC1, matrix);
        return Case{"copyTo a UMat", [attachment, matrix, bytes, &contents](std::size_t count) {
                        // Borrows the contents, which copyTo only reads.
                        const cv::Mat source(1, bytes, CV_8UC1, const_cast<char*>(contents.data()));
                        return timedLoop(count, [&] { source.copyTo(matrix); });
                    }};
    }
};

} // namespace

const ThirdPartyBaseline& openCV()
{
    static const OpenCV library;
    return library;
}
