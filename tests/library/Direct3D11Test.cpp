// Whole evaluations with a Direct3D 11 renderer: its buffers are deformed, through either
// extension.
#include "LibraryTest.h"
#include "Platform.h"

#include "host/EvaluationId.h"
#include "runtime/TopenCLInfo.h"

#include <algorithm>
#include <string>

#include <CL/cl_d3d11.h>

namespace {

constexpr unsigned kElements = 3000;
constexpr unsigned kBytes = kElements * sizeof(float);

struct Release {
    void operator()(IUnknown* object) const { object->Release(); }
};
template <typename T>
using Pointer = std::unique_ptr<T, Release>;

class Direct3D11 : public LibraryTest, public testing::WithParamInterface<const char*> {
protected:
    void SetUp() override
    {
        makeDevice();
        setEnvironment("GLSHARE_D3D11", GetParam());
        ASSERT_NO_FATAL_FAILURE(chooseFirstPlatform());
        ASSERT_TRUE(TopenCLInfo::initialize(nullptr, fDevice.get(), nullptr, true, false, 0));
        ASSERT_TRUE(TopenCLInfo::theOne().usingDX());
    }

    void makeDevice()
    {
        ID3D11Device* device = nullptr;
        ID3D11DeviceContext* commands = nullptr;
        ASSERT_EQ(D3D11CreateDevice(nullptr, D3D_DRIVER_TYPE_HARDWARE, nullptr, 0, nullptr, 0,
                                    D3D11_SDK_VERSION, &device, nullptr, &commands),
                  S_OK);
        fDevice.reset(device);
        fCommands.reset(commands);
    }

    static const TopenCLSharedBuffer* share(ID3D11Buffer* buffer, int& error)
    {
        return manager().CreateSharedCLBuffer(TopenCLInfo::theOne().openCLContext(),
                                              CL_MEM_READ_WRITE, buffer, &error);
    }

    Pointer<ID3D11Buffer> makeBuffer(D3D11_USAGE usage, UINT bindFlags, UINT access)
    {
        const D3D11_BUFFER_DESC description{kBytes, usage, bindFlags, access, 0, 0};
        ID3D11Buffer* buffer = nullptr;
        EXPECT_EQ(fDevice->CreateBuffer(&description, nullptr, &buffer), S_OK);
        return Pointer<ID3D11Buffer>(buffer);
    }

    void write(ID3D11Buffer* buffer, float value)
    {
        const std::vector<float> values(kElements, value);
        fCommands->UpdateSubresource(buffer, 0, nullptr, values.data(), 0, 0);
    }

    std::vector<float> read(ID3D11Buffer* buffer)
    {
        const auto copy = makeBuffer(D3D11_USAGE_STAGING, 0, D3D11_CPU_ACCESS_READ);
        fCommands->CopyResource(copy.get(), buffer);
        D3D11_MAPPED_SUBRESOURCE mapped{};
        EXPECT_EQ(fCommands->Map(copy.get(), 0, D3D11_MAP_READ, 0, &mapped), S_OK);
        std::vector<float> values(kElements);
        std::copy_n(static_cast<const float*>(mapped.pData), kElements, values.begin());
        fCommands->Unmap(copy.get(), 0);
        return values;
    }

    // x -> x + amount, as a deformer does it.
    static void deform(const TopenCLSharedBuffer* shared, cl_kernel add, float amount)
    {
        const cl_command_queue queue = TopenCLInfo::theOne().openCLCommandQueue();
        AutoCLObject<cl_event> acquired;
        ASSERT_EQ(manager().EnqueueAcquireSharedCLBuffer(queue, shared, acquired.receive()),
                  CL_SUCCESS);
        const auto added =
            enqueueDeform(queue, add, shared->fMem.get(), amount, kElements, {acquired.get()});
        const cl_event last = added.get();
        manager().EnqueueReleaseBatchedSharedCLBuffer(1, &last);
    }

    Pointer<ID3D11Device> fDevice;
    Pointer<ID3D11DeviceContext> fCommands;
};

} // namespace

TEST_P(Direct3D11, KernelResultsReachBuffers)
{
    std::vector<Pointer<ID3D11Buffer>> buffers;
    std::vector<const TopenCLSharedBuffer*> shared;
    for (int index = 0; index < 3; ++index) {
        int error = CL_SUCCESS;
        buffers.push_back(makeBuffer(D3D11_USAGE_DEFAULT, D3D11_BIND_VERTEX_BUFFER, 0));
        shared.push_back(share(buffers.back().get(), error));
        ASSERT_NE(shared.back(), nullptr) << error;
    }
    const AutoCLObject<cl_kernel> add = deformKernel("add");
    for (std::uint16_t frame = 0; frame < 10; ++frame) {
        for (const auto& buffer : buffers)
            write(buffer.get(), frame);
        const em::Id id(frame);
        manager().PreEvaluate(id);
        for (std::size_t index = 0; index < shared.size(); ++index)
            deform(shared[index], add.get(), static_cast<float>(index + 1));
        manager().PostEvaluate(id);
        manager().RenderingComplete();
        for (std::size_t index = 0; index < buffers.size(); ++index) {
            const float expected = static_cast<float>(frame) + static_cast<float>(index + 1);
            EXPECT_EQ(read(buffers[index].get()), std::vector<float>(kElements, expected))
                << "frame " << frame << ", buffer " << index;
        }
    }
    for (const TopenCLSharedBuffer* record : shared)
        EXPECT_EQ(manager().DestroySharedCLBuffer(record), CL_SUCCESS);
}

TEST_P(Direct3D11, BuffersOfOtherApiOrDeviceAreRejected)
{
    const auto function = [](const std::string& name) {
        const std::string suffix = std::string(GetParam()) == "nv" ? "NV" : "KHR";
        return reinterpret_cast<clEnqueueAcquireD3D11ObjectsKHR_fn>(
            clGetExtensionFunctionAddress((name + suffix).c_str()));
    };
    const auto acquire = function("clEnqueueAcquireD3D11Objects");
    const auto release = function("clEnqueueReleaseD3D11Objects");
    const auto buffer = makeBuffer(D3D11_USAGE_DEFAULT, D3D11_BIND_VERTEX_BUFFER, 0);
    int error = CL_SUCCESS;
    const TopenCLSharedBuffer* shared = share(buffer.get(), error);
    ASSERT_NE(shared, nullptr);
    const cl_command_queue queue = TopenCLInfo::theOne().openCLCommandQueue();
    const cl_mem memory = shared->fMem.get();
    EXPECT_EQ(release(queue, 1, &memory, 0, nullptr, nullptr), CL_D3D11_RESOURCE_NOT_ACQUIRED_KHR);
    EXPECT_EQ(acquire(queue, 1, &memory, 0, nullptr, nullptr), CL_SUCCESS);
    EXPECT_EQ(acquire(queue, 1, &memory, 0, nullptr, nullptr),
              CL_D3D11_RESOURCE_ALREADY_ACQUIRED_KHR);
    EXPECT_EQ(release(queue, 1, &memory, 0, nullptr, nullptr), CL_SUCCESS);
    manager().DestroySharedCLBuffer(shared);

    const Pointer<ID3D11Device> first = std::move(fDevice);
    makeDevice();
    const auto other = makeBuffer(D3D11_USAGE_DEFAULT, D3D11_BIND_VERTEX_BUFFER, 0);
    EXPECT_EQ(share(other.get(), error), nullptr);
    EXPECT_EQ(error, CL_INVALID_D3D11_RESOURCE_KHR);
}

INSTANTIATE_TEST_SUITE_P(Extension, Direct3D11, testing::Values("khr", "nv"),
                         [](const auto& row) { return std::string(row.param); });
