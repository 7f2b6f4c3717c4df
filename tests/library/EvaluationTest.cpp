// Whole evaluations: the renderer writes, OpenCL deforms, the renderer reads the expected values,
// in every pair of synchronisation modes.
#include "LibraryTest.h"
#include "Named.h"

#include "host/EvaluationId.h"
#include "runtime/TopenCLInfo.h"

#include <functional>
#include <thread>

namespace {

constexpr std::size_t kElements = 3000;
constexpr int kFrames = 12;

struct Modes : Named {
    const char* graphicsToCL;
    const char* clToGraphics;
    const char* forceThreading = nullptr;
};

// One mesh: its vertex buffer at the renderer, its record, its kernels and its queue.
struct Mesh {
    unsigned glBuffer = 0;
    const TopenCLSharedBuffer* shared = nullptr;
    bool unbatched = false; // outside the batch in this evaluation
    AutoCLObject<cl_kernel> add;
    AutoCLObject<cl_kernel> scale;
    std::shared_ptr<_cl_command_queue> queue;
    AutoCLObject<cl_event> released; // of an unbatched release
};

class Evaluation : public LibraryTest, public testing::WithParamInterface<Modes> {
protected:
    void SetUp() override
    {
        // If both modes are explicit, the sharing layer must not order commands itself.
        const bool implicit =
            GetParam().graphicsToCL[0] == '1' || GetParam().clToGraphics[0] == '1';
        start({{"VYRA_GRAPHICSTOOPENCL_SYNC_MODE", GetParam().graphicsToCL},
               {"VYRA_OPENCLTOGRAPHICS_SYNC_MODE", GetParam().clToGraphics},
               {"VYRA_OPENCL_FORCE_THREADING", GetParam().forceThreading},
               {"GLSHARE_GL_EVENT", implicit ? nullptr : "0"}});
    }

    static std::vector<float> everywhere(float value)
    {
        return std::vector<float>(kElements, value);
    }

    void addMesh()
    {
        Mesh& mesh = fMeshes.emplace_back();
        mesh.glBuffer = renderer().makeBuffer(everywhere(0.0F));
        mesh.add = deformKernel("add");
        mesh.scale = deformKernel("scale");
        mesh.queue = {TopenCLInfo::theOne().createOpenCLCommandQueue(nullptr),
                      clReleaseCommandQueue};
        share(mesh);
        mesh.unbatched = GetParam().forceThreading != nullptr;
    }

    static void share(Mesh& mesh)
    {
        int error = CL_SUCCESS;
        mesh.shared = manager().CreateSharedCLBuffer(TopenCLInfo::theOne().openCLContext(),
                                                     CL_MEM_READ_WRITE, &mesh.glBuffer, &error);
        ASSERT_NE(mesh.shared, nullptr) << error;
    }

    // A deformer: x -> 2 (x + 1), with its input acquired and its last event reported.
    static void deform(Mesh& mesh)
    {
        AutoCLObject<cl_event> acquired;
        ASSERT_EQ(manager().EnqueueAcquireSharedCLBuffer(mesh.queue.get(), mesh.shared,
                                                         acquired.receive()),
                  CL_SUCCESS);
        ASSERT_NE(acquired.get(), nullptr);
        const cl_mem memory = mesh.shared->fMem.get();
        const auto added = enqueueDeform(mesh.queue.get(), mesh.add.get(), memory, 1.0F, kElements,
                                         {acquired.get()});
        const auto scaled = enqueueDeform(mesh.queue.get(), mesh.scale.get(), memory, 2.0F,
                                          kElements, {added.get()});
        const cl_event last = scaled.get();
        if (!mesh.unbatched) {
            manager().EnqueueReleaseBatchedSharedCLBuffer(1, &last);
        } else {
            ASSERT_EQ(manager().EnqueueReleaseSharedCLBuffer(mesh.queue.get(), 1, &memory, 1, &last,
                                                             mesh.released.receive()),
                      CL_SUCCESS);
        }
        clFlush(mesh.queue.get());
    }

    // Makes the waits that the modes leave to the host before it draws.
    void waitUntilDrawable()
    {
        TopenCLInfo::flush();
        const cl_event batchReleased = *manager().EnqueueReleaseBatchedSharedCLBuffer(0, nullptr);
        if (TopenCLInfo::theOne().clToGraphicsSyncMode() == TopenCLInfo::kCLToGraphicsEventQuery) {
            while (!TopenCLInfo::IsEventComplete(batchReleased))
                std::this_thread::yield();
        }
        if (TopenCLInfo::theOne().useCLFinish())
            TopenCLInfo::finish();
        // Unbatched releases were enqueued on threads without an OpenGL context.
        for (Mesh& mesh : fMeshes) {
            if (const cl_event event = mesh.released.get()) {
                EXPECT_EQ(clWaitForEvents(1, &event), CL_SUCCESS);
            }
            mesh.released.reset();
        }
    }

    // Evaluates after the renderer has drawn; calls `duringIt` once the evaluation is open.
    void evaluate(int frame, const std::function<void()>& duringIt = nullptr)
    {
        manager().RenderingComplete();
        renderer().flush();
        if (TopenCLInfo::theOne().useGLFinish())
            renderer().finish();
        const em::Id id(static_cast<std::uint16_t>(frame));
        manager().PreEvaluate(id);
        if (duringIt)
            duringIt();
        std::vector<std::jthread> deformers;
        for (Mesh& mesh : fMeshes)
            deformers.emplace_back([&mesh] { deform(mesh); });
        deformers.clear();
        manager().PostEvaluate(id);
        waitUntilDrawable();
    }

    std::vector<Mesh> fMeshes;
};

} // namespace

TEST_P(Evaluation, KernelResultsReachGLBuffers)
{
    for (int frame = 0; frame < kFrames; ++frame) {
        SCOPED_TRACE(frame);
        while (fMeshes.size() < (frame < kFrames / 3 ? 3U : 4U))
            addMesh(); // the last one is unbatched until it joins the batch
        const auto first = static_cast<float>(frame * 10);
        for (float input = first; const Mesh& mesh : fMeshes)
            renderer().writeBuffer(mesh.glBuffer, everywhere(input++));
        evaluate(frame);
        for (float input = first; const Mesh& mesh : fMeshes)
            EXPECT_EQ(renderer().readBuffer(mesh.glBuffer, kElements),
                      everywhere(2.0F * (input++ + 1.0F)));
    }
    EXPECT_EQ(fMeshes.back().shared->fInBatch, GetParam().forceThreading == nullptr);
    for (Mesh& mesh : fMeshes)
        manager().DestroySharedCLBuffer(mesh.shared);
}

TEST_P(Evaluation, BuffersAreCreatedAndDestroyedDuringEvaluation)
{
    while (fMeshes.size() < 3)
        addMesh();
    Mesh& changing = fMeshes[1];
    for (int frame = 0; frame < kFrames; ++frame) {
        SCOPED_TRACE(frame);
        for (const Mesh& mesh : fMeshes)
            renderer().writeBuffer(mesh.glBuffer, everywhere(5.0F));
        evaluate(frame, [&] {
            // As for a change of the level of detail: another buffer replaces the mesh's.
            EXPECT_EQ(manager().DestroyBatchedSharedCLBuffer(changing.shared), CL_SUCCESS);
            renderer().deleteBuffer(changing.glBuffer);
            changing.glBuffer = renderer().makeBuffer(everywhere(5.0F));
            renderer().finish();
            share(changing);
            EXPECT_FALSE(changing.shared->fInBatch);
            changing.unbatched = true;
        });
        changing.unbatched = GetParam().forceThreading != nullptr; // it has joined the batch
        for (const Mesh& mesh : fMeshes)
            EXPECT_EQ(renderer().readBuffer(mesh.glBuffer, kElements), everywhere(12.0F));
    }
}

INSTANTIATE_TEST_SUITE_P(
    Modes, Evaluation,
    testing::Values(Modes{"implicit, implicit", "1", "1"}, Modes{"implicit, event query", "1", "2"},
                    Modes{"explicit, event query", "2", "2"},
                    Modes{"explicit, sync object", "2", "3"}, Modes{"explicit, clFinish", "2", "4"},
                    Modes{"glFinish, sync object", "3", "3"}, Modes{"glFinish, clFinish", "3", "4"},
                    Modes{"nothing batched", "1", "2", "1"}));
