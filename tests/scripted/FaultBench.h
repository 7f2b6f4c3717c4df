// Subjects that a test creates again for every fault, and operations on them whose result is a
// number. The bench owns all of them.
#pragma once

#include "Objects.h"
#include "ScriptedTest.h"
#include "buffers/TopenCLBuffer.h"
#include "buffers/TopenCLData.h"
#include "buffers/TopenCLDataBufferPool.h"
#include "host/EvaluationId.h"
#include "interop/GraphicsSync.h"
#include "kernels/TopenCLKernelStore.h"

#include <array>
#include <memory>
#include <optional>
#include <vector>

namespace scripted {

class Bench {
public:
    Bench() = default;
    Bench(const Bench&) = delete;
    Bench& operator=(const Bench&) = delete;
    ~Bench() { dropManager(); }

    // Creates a buffer with a mapping, and with a pending write if `pending`.
    void makeBuffer(std::size_t bytes, bool pending = false)
    {
        buffer.reset();
        buffer.emplace(context(), CL_MEM_ALLOC_HOST_PTR | CL_MEM_HOST_WRITE_ONLY);
        buffer->ensureBufferCapacity(bytes);
        if (pending)
            upload(0, 1);
    }
    int upload(std::size_t offset, std::size_t size)
    {
        return buffer->uploadDataToGPU(queue(), CL_FALSE, offset, size, fBytes.data(), 0, nullptr);
    }
    int readBack()
    {
        return buffer->readBackDataFromGPU(queue(), CL_FALSE, 0, 8, fBytes.data(), 0, nullptr);
    }

    // Creates a pool with one free buffer; with none if `bytes` is 0.
    void makePool(unsigned bytes)
    {
        data = {};
        pool.emplace();
        if (bytes == 0)
            return;
        data = pool->createBuffer(describe(bytes));
        pool->releaseBuffers();
    }
    int fromPool(unsigned bytes)
    {
        return int{pool->createBuffer(describe(bytes)).buffer().get() != nullptr};
    }
    int mapTwice() // a map, its copy and an overwrite
    {
        TopenCLData map;
        map.setData(TopenCLData::sPositionsName(), Tplug(), data);
        TopenCLData copy(map);
        copy.setData(TopenCLData::sPositionsName(), Tplug(), TopenCLDataBuffer::fsNULL);
        copy = map;
        return int{copy.empty()};
    }

    void makeStore()
    {
        kernel.reset();
        store = std::make_unique<TopenCLKernelStore>();
        store->initialize(context(), info().openCLDevice(), kIntelProvider);
    }
    int getKernel()
    {
        kernel = store->getKernelFromString("skin", "program", "", "skin", nullptr);
        return int{kernel.get() != nullptr};
    }

    // Creates a manager with this number of buffers.
    void makeManager(int buffers)
    {
        dropManager();
        manager = std::make_unique<TopenCLSharedBufferMgr>();
        shared.reserve(4); // so that only the library allocates in an operation
        for (int i = 0; i < buffers; ++i)
            createShared();
    }
    int createShared()
    {
        int status = CL_SUCCESS;
        const auto* record = makeShared(*manager, &status);
        if (record)
            shared.push_back(record);
        return int{record != nullptr};
    }
    int destroy() { return manager->DestroySharedCLBuffer(takeFirst()); }
    int leaveBatch() { return manager->DestroyBatchedSharedCLBuffer(takeFirst()); }
    void open() { manager->PreEvaluate(em::Id(1)); }
    void close() { manager->PostEvaluate(em::Id(1)); }
    void evaluate()
    {
        open();
        close();
    }
    int acquire()
    {
        return manager->EnqueueAcquireSharedCLBuffer(queue(), shared.front(),
                                                     fEvents.emplace_back().receive());
    }
    int release()
    {
        const cl_mem mem = shared.front()->fMem.get();
        return manager->EnqueueReleaseSharedCLBuffer(queue(), 1, &mem, 0, nullptr,
                                                     fEvents.emplace_back().receive());
    }
    int reportEvent()
    {
        const cl_event event = fEvents.back().get();
        return int{*manager->EnqueueReleaseBatchedSharedCLBuffer(1, &event) != nullptr};
    }

    std::optional<TopenCLBuffer> buffer;
    std::optional<TopenCLDataBufferPool> pool;
    TopenCLDataBuffer data;
    std::unique_ptr<TopenCLKernelStore> store;
    AutoCLObject<cl_kernel> kernel;
    std::unique_ptr<TopenCLSharedBufferMgr> manager;
    std::vector<const TopenCLSharedBuffer*> shared;

private:
    static TopenCLDataBufferDescriptor describe(unsigned bytes)
    {
        using Descriptor = TopenCLDataBufferDescriptor;
        return {Tplug(), TopenCLData::sPositionsName(), Descriptor::kReadWrite, 1, bytes, 0};
    }
    const TopenCLSharedBuffer* takeFirst()
    {
        const auto* record = shared.front();
        shared.erase(shared.begin());
        return record;
    }
    // Closes an open evaluation and waits for the fence: both outlive the manager.
    void dropManager()
    {
        if (!manager)
            return;
        close();
        manager.reset();
        shared.clear();
        fEvents.clear();
        WaitForGraphicsFence();
    }

    std::vector<AutoCLObject<cl_event>> fEvents;
    std::array<char, 128> fBytes{};
};

} // namespace scripted
