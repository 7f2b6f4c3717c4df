// The renderer's fence, waited for by deformers on threads without an OpenGL context.
#include "LibraryTest.h"

#include "host/GLFunctionTable.h"
#include "runtime/TopenCLInfo.h"

#include <array>
#include <atomic>
#include <thread>

namespace {

GLFunctionTable driver; // behind the host's table
std::atomic<int> waitsEnded = 0;

class Fence : public LibraryTest {
protected:
    void SetUp() override
    {
        start({{"VYRA_GRAPHICSTOOPENCL_SYNC_MODE", "2"}, {"GLSHARE_GL_EVENT", "0"}});
    }
};

} // namespace

TEST_F(Fence, IsWaitedForOnceWhoeverAcquiresFirst)
{
    std::array<const TopenCLSharedBuffer*, 4> buffers{};
    for (const TopenCLSharedBuffer*& buffer : buffers) {
        unsigned name = renderer().makeBuffer(std::vector<float>(64, 1.0F));
        int error = CL_SUCCESS;
        buffer = manager().CreateSharedCLBuffer(TopenCLInfo::theOne().openCLContext(),
                                                CL_MEM_READ_WRITE, &name, &error);
        ASSERT_NE(buffer, nullptr) << error;
    }
    GLFunctionTable& table = *GLFunctionTable::fpGlobalFunctionTable;
    driver = table;
    table.glClientWaitSync = [](GLsync sync, unsigned flags, std::uint64_t timeout) {
        const unsigned result = driver.glClientWaitSync(sync, flags, timeout);
        ++waitsEnded;
        return result;
    };
    constexpr int kRounds = 50;
    for (int round = 0; round < kRounds; ++round) {
        manager().RenderingComplete();
        std::vector<std::jthread> deformers;
        deformers.reserve(buffers.size());
        for (const TopenCLSharedBuffer* buffer : buffers) {
            deformers.emplace_back([buffer, queue = TopenCLInfo::theOne().openCLCommandQueue()] {
                const cl_mem mem = buffer->fMem.get();
                manager().EnqueueAcquireSharedCLBuffer(queue, buffer, nullptr);
                EXPECT_EQ(
                    manager().EnqueueReleaseSharedCLBuffer(queue, 1, &mem, 0, nullptr, nullptr),
                    CL_SUCCESS);
            });
        }
    }
    TopenCLInfo::finish();
    EXPECT_EQ(waitsEnded, kRounds);
    for (const TopenCLSharedBuffer* buffer : buffers)
        manager().DestroySharedCLBuffer(buffer);
}
