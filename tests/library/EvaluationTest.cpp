// Whole evaluations: the renderer writes, OpenCL deforms, the renderer reads, and the numbers are
// right in every pair of synchronisation modes.
#include "LibraryTest.h"

#include "host/EvaluationId.h"
#include "kernels/TopenCLKernelStore.h"
#include "runtime/TopenCLInfo.h"

#include <algorithm>
#include <functional>
#include <thread>

namespace {

constexpr std::size_t kElements = 3000;
constexpr int kFrames = 12;

struct Modes {
    const char* description;
    const char* graphicsToCL;
    const char* clToGraphics;
    const char* forceThreading = nullptr;
};

void PrintTo(const Modes& modes, std::ostream* stream)
{
    *stream << modes.description;
}

struct QueueRelease {
    void operator()(cl_command_queue queue) const { clReleaseCommandQueue(queue); }
};

// One mesh: its vertex buffer at the renderer, its record, its kernels and its queue.
struct Mesh {
    unsigned glBuffer = 0;
    const TopenCLSharedBuffer* shared = nullptr;
    bool alone = false; // outside the batch in this evaluation
    AutoCLObject<cl_kernel> add;
    AutoCLObject<cl_kernel> scale;
    std::unique_ptr<_cl_command_queue, QueueRelease> queue;
    AutoCLObject<cl_event> released; // of a release on its own
};

class Evaluation : public LibraryTest, public testing::WithParamInterface<Modes> {
protected:
    void SetUp() override
    {
        // Where a mode is explicit, the sharing layer must not order things by itself.
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

    Mesh makeMesh()
    {
        Mesh mesh;
        mesh.glBuffer = renderer().makeBuffer(everywhere(0.0F));
        mesh.add = deformKernel("add");
        mesh.scale = deformKernel("scale");
        mesh.queue.reset(TopenCLInfo::theOne().createOpenCLCommandQueue(nullptr));
        share(mesh);
        mesh.alone = GetParam().forceThreading != nullptr;
        return mesh;
    }

    static void share(Mesh& mesh)
    {
        int error = CL_SUCCESS;
        mesh.shared = manager().CreateSharedCLBuffer(TopenCLInfo::theOne().openCLContext(),
                                                     CL_MEM_READ_WRITE, &mesh.glBuffer, &error);
        ASSERT_NE(mesh.shared, nullptr) << error;
    }

    // A deformer: x -> 2 (x + 1), with its input acquired and its last event handed over.
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
        if (!mesh.alone) {
            manager().EnqueueReleaseBatchedSharedCLBuffer(1, &last);
        } else {
            ASSERT_EQ(manager().EnqueueReleaseSharedCLBuffer(mesh.queue.get(), 1, &memory, 1, &last,
                                                             mesh.released.receive()),
                      CL_SUCCESS);
        }
        clFlush(mesh.queue.get());
    }

    std::vector<Mesh> makeMeshes()
    {
        std::vector<Mesh> meshes(3);
        std::generate(meshes.begin(), meshes.end(), [this] { return makeMesh(); });
        return meshes;
    }

    static void deformInParallel(std::vector<Mesh>& meshes)
    {
        std::vector<std::jthread> deformers;
        deformers.reserve(meshes.size());
        for (Mesh& mesh : meshes)
            deformers.emplace_back([&mesh] { deform(mesh); });
    }

    // What the modes leave to the host before it draws.
    static void waitAsTheHostDoes(std::vector<Mesh>& meshes)
    {
        TopenCLInfo::flush();
        const cl_event batchReleased = *manager().EnqueueReleaseBatchedSharedCLBuffer(0, nullptr);
        if (TopenCLInfo::theOne().clToGraphicsSyncMode() == TopenCLInfo::kCLToGraphicsEventQuery) {
            while (!TopenCLInfo::IsEventComplete(batchReleased))
                std::this_thread::yield();
        }
        if (TopenCLInfo::theOne().useCLFinish())
            TopenCLInfo::finish();
        // Releases of single buffers came from threads that know of no OpenGL context.
        for (Mesh& mesh : meshes) {
            if (const cl_event event = mesh.released.get()) {
                EXPECT_EQ(clWaitForEvents(1, &event), CL_SUCCESS);
            }
            mesh.released.reset();
        }
    }

    // One evaluation, after the renderer has drawn; `atItsBeginning` is what else happens in it.
    void evaluate(std::vector<Mesh>& meshes, int frame,
                  const std::function<void()>& atItsBeginning = nullptr)
    {
        manager().RenderingComplete();
        renderer().flush();
        if (TopenCLInfo::theOne().useGLFinish())
            renderer().finish();
        const em::Id id(static_cast<std::uint16_t>(frame));
        manager().PreEvaluate(id);
        if (atItsBeginning)
            atItsBeginning();
        deformInParallel(meshes);
        manager().PostEvaluate(id);
        waitAsTheHostDoes(meshes);
    }
};

} // namespace

TEST_P(Evaluation, NumbersArriveInGLMemory)
{
    std::vector<Mesh> meshes = makeMeshes();
    for (int frame = 0; frame < kFrames; ++frame) {
        SCOPED_TRACE(frame);
        const auto first = static_cast<float>(frame * 10);
        for (float input = first; const Mesh& mesh : meshes)
            renderer().writeBuffer(mesh.glBuffer, everywhere(input++));
        evaluate(meshes, frame);
        for (float input = first; const Mesh& mesh : meshes)
            EXPECT_EQ(renderer().readBuffer(mesh.glBuffer, kElements),
                      everywhere(2.0F * (input++ + 1.0F)));
        if (frame == kFrames / 3)
            meshes.push_back(makeMesh()); // on its own until it joins the batch
    }
    EXPECT_EQ(meshes.back().shared->fInBatch, GetParam().forceThreading == nullptr);
    for (Mesh& mesh : meshes)
        manager().DestroySharedCLBuffer(mesh.shared);
}

TEST_P(Evaluation, BuffersComeAndGoWithinAnEvaluation)
{
    std::vector<Mesh> meshes = makeMeshes();
    for (int frame = 0; frame < kFrames; ++frame) {
        SCOPED_TRACE(frame);
        for (const Mesh& mesh : meshes)
            renderer().writeBuffer(mesh.glBuffer, everywhere(5.0F));
        evaluate(meshes, frame, [&] {
            // The middle mesh changes its level of detail: its buffer goes and another comes.
            EXPECT_EQ(manager().DestroyBatchedSharedCLBuffer(meshes[1].shared), CL_SUCCESS);
            renderer().deleteBuffer(meshes[1].glBuffer);
            meshes[1].glBuffer = renderer().makeBuffer(everywhere(5.0F));
            renderer().finish();
            share(meshes[1]);
            EXPECT_FALSE(meshes[1].shared->fInBatch);
            meshes[1].alone = true;
        });
        meshes[1].alone = GetParam().forceThreading != nullptr; // it has joined the batch
        for (const Mesh& mesh : meshes)
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
