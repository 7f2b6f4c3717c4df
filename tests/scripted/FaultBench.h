// What an operation is tried on: subjects that a test makes anew for every fault, and operations
// whose result is a number. Everything goes with the bench.
#pragma once

#include "ScriptedTest.h"
#include "buffers/TopenCLBuffer.h"
#include "buffers/TopenCLData.h"
#include "buffers/TopenCLDataBufferPool.h"
#include "interop/TopenCLSharedBufferMgr.h"
#include "kernels/TopenCLKernelStore.h"
#include "runtime/TopenCLInfo.h"

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
    ~Bench();

    // A buffer with a mapping, and with a pending write where asked.
    void makeBuffer(std::size_t bytes, bool pending = false);
    int upload(std::size_t offset, std::size_t size);
    int readBack();
    int wrap(); // a buffer around the buffer's data, and copies of it

    // A pool with one free buffer; none where `bytes` is 0.
    void makePool(unsigned bytes);
    int fromPool(unsigned bytes); // 1: with memory
    int output();
    int mapTwice(); // a map, its copy and an overwrite

    void makeStore();
    int getKernel(); // 1: a kernel, kept
    int workGroupSizes();
    int makeQueue(); // 1: a queue

    // A manager with as many buffers.
    void makeManager(int buffers);
    int createShared(); // 1: a record, kept
    int destroy();      // the first
    int leaveBatch();
    int open();
    int close();
    int evaluate() { return open() + close(); }
    int acquire();
    int release();
    int handOver();
    int copyManager();

    std::optional<TopenCLBuffer> buffer;
    std::optional<TopenCLDataBufferPool> pool;
    TopenCLDataBuffer data;
    std::unique_ptr<TopenCLKernelStore> store;
    AutoCLObject<cl_kernel> kernel;
    std::unique_ptr<TopenCLSharedBufferMgr> manager;
    std::vector<const TopenCLSharedBuffer*> shared;

private:
    void dropManager();

    std::vector<AutoCLObject<cl_event>> fEvents;
    std::vector<cl_command_queue> fQueues;
    std::array<char, 128> fBytes{};
};

} // namespace scripted
