#include "FaultBench.h"

#include "host/EvaluationId.h"
#include "interop/GraphicsSync.h"
#include <CL/cl.h>

namespace scripted {
namespace {

const em::Id kId(1);
const Tplug kPlug(1, 2);

TopenCLDataBufferDescriptor describe(unsigned bytes)
{
    return {kPlug, TopenCLData::sPositionsName(), TopenCLDataBufferDescriptor::kReadWrite, 1, bytes,
            0};
}

TopenCLInfo& info()
{
    return TopenCLInfo::theOne();
}

} // namespace

Bench::~Bench()
{
    dropManager();
    for (cl_command_queue queue : fQueues)
        clReleaseCommandQueue(queue);
}

void Bench::makeBuffer(std::size_t bytes, bool pending)
{
    buffer.reset();
    buffer.emplace(info().openCLContext(), CL_MEM_ALLOC_HOST_PTR | CL_MEM_HOST_WRITE_ONLY);
    buffer->ensureBufferCapacity(bytes);
    if (pending)
        upload(0, 1);
}

int Bench::upload(std::size_t offset, std::size_t size)
{
    return buffer->uploadDataToGPU(info().openCLCommandQueue(), CL_FALSE, offset, size,
                                   fBytes.data(), 0, nullptr);
}

int Bench::readBack()
{
    return buffer->readBackDataFromGPU(info().openCLCommandQueue(), CL_FALSE, 0, 8, fBytes.data(),
                                       0, nullptr);
}

int Bench::wrap()
{
    TopenCLBuffer wrapped(info().openCLContext(), CL_MEM_READ_WRITE, buffer->openCLDataBuffer());
    TopenCLBuffer copy(wrapped);
    copy = *buffer;
    return copy.buffer().get() == buffer->buffer().get() ? 1 : 0;
}

void Bench::makePool(unsigned bytes)
{
    data = {};
    pool.emplace();
    if (bytes == 0)
        return;
    data = pool->createBuffer(describe(bytes));
    pool->releaseBuffers();
}

int Bench::fromPool(unsigned bytes)
{
    return pool->createBuffer(describe(bytes)).buffer().get() ? 1 : 0;
}

int Bench::output()
{
    return pool->createOutputBuffer(data, kPlug).buffer().get() == data.buffer().get() ? 1 : 0;
}

int Bench::mapTwice()
{
    TopenCLData map;
    map.setData(TopenCLData::sPositionsName(), kPlug, data);
    TopenCLData copy(map);
    copy.setData(TopenCLData::sPositionsName(), kPlug, TopenCLDataBuffer::fsNULL);
    copy = map;
    return copy.getSinglePlug() == kPlug ? 1 : 0;
}

void Bench::makeStore()
{
    kernel.reset();
    store = std::make_unique<TopenCLKernelStore>();
    store->initialize(info().openCLContext(), info().openCLDevice(), kIntelProvider);
}

int Bench::getKernel()
{
    kernel = store->getKernelFromString("skin", "program", "", "skin", nullptr);
    return kernel.get() ? 1 : 0;
}

int Bench::workGroupSizes()
{
    std::size_t global = 0;
    std::size_t local = 0;
    return info().getWorkGroupSizes(kernel.get(), 100, global, local);
}

int Bench::makeQueue()
{
    const cl_command_queue queue = info().createOpenCLCommandQueue(nullptr);
    if (queue)
        fQueues.push_back(queue);
    return queue ? 1 : 0;
}

// An evaluation that is open is closed, and the fence waited for: both outlive the manager.
void Bench::dropManager()
{
    if (!manager)
        return;
    manager->PostEvaluate(kId);
    manager.reset();
    shared.clear();
    fEvents.clear();
    WaitForGraphicsFence();
}

void Bench::makeManager(int buffers)
{
    dropManager();
    manager = std::make_unique<TopenCLSharedBufferMgr>();
    shared.reserve(4); // so that only the library allocates in an operation
    for (int i = 0; i < buffers; ++i)
        createShared();
}

int Bench::createShared()
{
    unsigned glBuffer = 7;
    int status = CL_SUCCESS;
    const auto* record = manager->CreateSharedCLBuffer(info().openCLContext(), CL_MEM_READ_WRITE,
                                                       &glBuffer, &status);
    if (record)
        shared.push_back(record);
    return record ? 1 : 0;
}

int Bench::destroy()
{
    const auto* record = shared.front();
    shared.erase(shared.begin());
    return manager->DestroySharedCLBuffer(record);
}

int Bench::leaveBatch()
{
    const auto* record = shared.front();
    shared.erase(shared.begin());
    return manager->DestroyBatchedSharedCLBuffer(record);
}

int Bench::open()
{
    manager->PreEvaluate(kId);
    return 0;
}

int Bench::close()
{
    manager->PostEvaluate(kId);
    return 0;
}

int Bench::acquire()
{
    AutoCLObject<cl_event> event;
    const int status = manager->EnqueueAcquireSharedCLBuffer(info().openCLCommandQueue(),
                                                             shared.front(), event.receive());
    fEvents.push_back(std::move(event));
    return status;
}

int Bench::release()
{
    AutoCLObject<cl_event> event;
    const cl_mem mem = shared.front()->fMem.get();
    const int status = manager->EnqueueReleaseSharedCLBuffer(info().openCLCommandQueue(), 1, &mem,
                                                             0, nullptr, event.receive());
    fEvents.push_back(std::move(event));
    return status;
}

int Bench::handOver()
{
    const cl_event event = fEvents.back().get();
    return *manager->EnqueueReleaseBatchedSharedCLBuffer(1, &event) ? 1 : 0;
}

int Bench::copyManager()
{
    const TopenCLSharedBufferMgr copy(*manager);
    TopenCLSharedBufferMgr assigned;
    assigned = copy;
    return 0;
}

} // namespace scripted
