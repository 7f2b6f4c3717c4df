// The renderer's fence, waited for by deformers on threads without an OpenGL context.
#include "LibraryTest.h"

#include "host/GLFunctionTable.h"
#include "runtime/TopenCLInfo.h"

#include <atomic>
#include <thread>

namespace {

std::atomic<int> fencesMade = 0;
std::atomic<int> fencesDeleted = 0;
std::atomic<int> waitsEnded = 0;
GLFunctionTable driver;

// Counts what passes through the host's table.
void countCalls(GLFunctionTable& table)
{
    driver = table;
    table.glFenceSync = [](unsigned condition, unsigned flags) {
        ++fencesMade;
        return driver.glFenceSync(condition, flags);
    };
    table.glDeleteSync = [](GLsync sync) {
        ++fencesDeleted;
        driver.glDeleteSync(sync);
    };
    table.glClientWaitSync = [](GLsync sync, unsigned flags, std::uint64_t timeout) {
        const unsigned result = driver.glClientWaitSync(sync, flags, timeout);
        ++waitsEnded;
        return result;
    };
}

} // namespace

class Fence : public LibraryTest {};

TEST_F(Fence, EachIsWaitedForOnceWhoeverAcquiresFirst)
{
    start({{"VYRA_GRAPHICSTOOPENCL_SYNC_MODE", "2"}, {"GLSHARE_GL_EVENT", "0"}});
    ASSERT_EQ(TopenCLInfo::theOne().graphicsToCLSyncMode(), TopenCLInfo::kGraphicsToCLExplicit);
    TopenCLSharedBufferMgr& manager = TopenCLInfo::theOne().sharedBufferMgr();
    constexpr std::size_t kBuffers = 4;
    std::vector<unsigned> names(kBuffers);
    std::vector<const TopenCLSharedBuffer*> records(kBuffers);
    for (std::size_t index = 0; index < kBuffers; ++index) {
        int error = CL_SUCCESS;
        names[index] = renderer().makeBuffer(std::vector<float>(64, 1.0F));
        records[index] = manager.CreateSharedCLBuffer(TopenCLInfo::theOne().openCLContext(),
                                                      CL_MEM_READ_WRITE, &names[index], &error);
        ASSERT_NE(records[index], nullptr);
    }
    countCalls(*GLFunctionTable::fpGlobalFunctionTable);

    constexpr int kRounds = 50;
    for (int round = 0; round < kRounds; ++round) {
        manager.RenderingComplete();
        manager.RenderingComplete(); // replaces the fence that nobody waited for
        std::vector<std::thread> deformers;
        deformers.reserve(records.size());
        for (const TopenCLSharedBuffer* record : records) {
            deformers.emplace_back([&manager, record] {
                cl_command_queue queue = TopenCLInfo::theOne().createOpenCLCommandQueue(nullptr);
                EXPECT_EQ(manager.EnqueueAcquireSharedCLBuffer(queue, record, nullptr), CL_SUCCESS);
                const cl_mem memory = record->fMem.get();
                EXPECT_EQ(
                    manager.EnqueueReleaseSharedCLBuffer(queue, 1, &memory, 0, nullptr, nullptr),
                    CL_SUCCESS);
                clFinish(queue);
                clReleaseCommandQueue(queue);
            });
        }
        for (std::thread& deformer : deformers)
            deformer.join();
    }
    EXPECT_EQ(fencesMade, 2 * kRounds);
    EXPECT_EQ(fencesDeleted, 2 * kRounds) << "none is left, none is deleted twice";
    EXPECT_EQ(waitsEnded, kRounds);
}
