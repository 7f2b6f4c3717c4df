// The shared-buffer manager: whole evaluations, rebuilds of the batch, and the calls of evaluators.
#include "cases/Cases.h"
#include "fixtures/GLBuffers.h"
#include "fixtures/InteropStub.h"
#include "fixtures/Runtime.h"
#include "harness/TwoThreads.h"
#include "host/EvaluationId.h"
#include "interop/TopenCLSharedBufferMgr.h"

#include <algorithm>
#include <memory>
#include <stdexcept>
#include <utility>

#include <CL/cl_gl.h>
#include <tbb/concurrent_vector.h>

namespace {

constexpr em::Id kEvaluation{1};

// Whole evaluations of a batch of the renderer's buffers, with the real interop calls.
class Evaluations {
public:
    Evaluations(Runtime& runtime, std::size_t count) : fBuffers(runtime, count)
    {
        for (unsigned& name : fBuffers.names()) {
            int error = CL_SUCCESS;
            const TopenCLSharedBuffer* record =
                fManager.CreateSharedCLBuffer(Runtime::context(), CL_MEM_READ_WRITE, &name, &error);
            if (!record)
                throw std::runtime_error("a buffer of the renderer cannot be shared");
            fMemory.push_back(record->fMem.get());
        }
        std::sort(fMemory.begin(), fMemory.end()); // the order of the batch
        requireOneCallEachWay();
    }
    Evaluations(const Evaluations&) = delete;
    Evaluations& operator=(const Evaluations&) = delete;

    void evaluate()
    {
        fManager.PreEvaluate(kEvaluation);
        fManager.PostEvaluate(kEvaluation);
        clFinish(Runtime::queue());
    }

    void evaluateDirectly()
    {
        const auto count = static_cast<cl_uint>(fMemory.size());
        cl_event acquired = nullptr;
        clEnqueueAcquireGLObjects(Runtime::queue(), count, fMemory.data(), 0, nullptr, &acquired);
        clRetainEvent(acquired); // the manager holds it for deformers and in the wait list
        cl_event released = nullptr;
        clEnqueueReleaseGLObjects(Runtime::queue(), count, fMemory.data(), 1, &acquired, &released);
        clReleaseEvent(acquired);
        clReleaseEvent(acquired);
        clReleaseEvent(released);
        clFinish(Runtime::queue());
    }

private:
    void requireOneCallEachWay()
    {
        const InteropCounter counter;
        evaluate();
        if (InteropCounter::acquires() != 1 || InteropCounter::releases() != 1)
            throw std::runtime_error("a batch took more than one interop call each way");
    }

    GLBuffers fBuffers; // outlives the memory objects made from it
    TopenCLSharedBufferMgr fManager;
    std::vector<cl_mem> fMemory; // the manager's
};

Group evaluation(const std::string& name, Runtime& runtime, std::size_t count)
{
    constexpr double kLimit = 1.03;
    const auto evaluations = std::make_shared<Evaluations>(runtime, count);
    return {name,
            {{"acquire, release, finish",
              [evaluations](std::size_t frames) {
                  return timedLoop(frames, [&] { evaluations->evaluateDirectly(); });
              }},
             {"PreEvaluate, PostEvaluate, finish",
              [evaluations](std::size_t frames) {
                  return timedLoop(frames, [&] { evaluations->evaluate(); });
              },
              count >= 16 ? Goal::ratio(kLimit) : Goal()}}};
}

// A manager of plain memory objects, with stubs as its interop functions.
class StubbedBatch {
public:
    explicit StubbedBatch(std::size_t count,
                          std::shared_ptr<InteropStub> stub = std::make_shared<InteropStub>())
        : fStub(std::move(stub))
    {
        constexpr std::size_t kBytes = 64;
        for (std::size_t index = 0; index < count; ++index) {
            cl_int status = CL_SUCCESS;
            fMemory.emplace_back().adopt(
                clCreateBuffer(Runtime::context(), CL_MEM_READ_WRITE, kBytes, nullptr, &status));
        }
        std::sort(fMemory.begin(), fMemory.end(),
                  [](const auto& one, const auto& other) { return one.get() < other.get(); });
        for (const auto& memory : fMemory)
            share(memory.get());
        evaluate();
    }
    StubbedBatch(const StubbedBatch&) = delete;
    StubbedBatch& operator=(const StubbedBatch&) = delete;

    TopenCLSharedBufferMgr& manager() { return fManager; }
    const TopenCLSharedBuffer* record() const { return fLastRecord; }

    void begin() { fManager.PreEvaluate(kEvaluation); }
    void end() { fManager.PostEvaluate(kEvaluation); }
    void evaluate()
    {
        begin();
        end();
    }

    // Marks the records as changed without a change, so that the next evaluation rebuilds the
    // batch.
    void touch() { share(fMemory.front().get()); }

    // Makes the calls of a rebuild: releases the references of the old batch, retains those of the
    // new.
    void rebuildDirectly() const
    {
        for (const auto& memory : fMemory)
            clReleaseMemObject(memory.get());
        for (const auto& memory : fMemory)
            clRetainMemObject(memory.get());
    }

private:
    void share(cl_mem memory)
    {
        int error = CL_SUCCESS;
        fLastRecord =
            fManager.CreateSharedCLBuffer(Runtime::context(), CL_MEM_READ_WRITE, &memory, &error);
    }

    std::shared_ptr<InteropStub> fStub;
    std::vector<AutoCLObject<cl_mem>> fMemory;
    TopenCLSharedBufferMgr fManager;
    const TopenCLSharedBuffer* fLastRecord = nullptr;
};

Body evaluations(std::size_t buffers, const std::shared_ptr<InteropStub>& stub)
{
    const auto share = std::make_shared<StubbedBatch>(buffers, stub);
    return [share](std::size_t frames) { return timedLoop(frames, [&] { share->evaluate(); }); };
}

// The baseline is a batch of one buffer, since the cost must not grow with the batch.
Group withoutInterop(const std::string& name, std::size_t count)
{
    constexpr double kFlat = 1.1;
    const auto stub = std::make_shared<InteropStub>();
    const Body one = evaluations(1, stub);
    const Body many = evaluations(count, stub);
    return {name, {{"1 buffer", one}, {"all buffers", many, Goal::ratio(kFlat)}}};
}

Group rebuild(const std::string& name, std::size_t count)
{
    constexpr double kLimit = 1.5;
    const auto share = std::make_shared<StubbedBatch>(count);
    return {name,
            {{"releases, retains",
              [share](std::size_t times) {
                  return timedLoop(times, [&] { share->rebuildDirectly(); });
              }},
             {"rebuilding evaluation",
              [share](std::size_t times) {
                  return timedLoop(times, [&] {
                      share->touch();
                      share->evaluate();
                  });
              },
              Goal::ratio(kLimit)}}};
}

cl_event makeCompleteEvent()
{
    cl_int status = CL_SUCCESS;
    cl_event event = clCreateUserEvent(Runtime::context(), &status);
    clSetUserEventStatus(event, CL_COMPLETE);
    return event;
}

// A deformer acquires a batched buffer, and releases the event.
Group acquireBatched(const std::string& name)
{
    constexpr double kLimit = 5;
    const auto share = std::make_shared<StubbedBatch>(16);
    AutoCLObject<cl_event> event;
    event.adopt(makeCompleteEvent());
    return {name,
            {{"retain, release",
              [event](std::size_t count) {
                  return timedLoop(count, [&] {
                      clRetainEvent(event.get());
                      clReleaseEvent(event.get());
                  });
              }},
             {"EnqueueAcquireSharedCLBuffer, release",
              [share](std::size_t count) {
                  share->begin();
                  const Nanoseconds time = timedLoop(count, [&] {
                      cl_event acquired = nullptr;
                      share->manager().EnqueueAcquireSharedCLBuffer(Runtime::queue(),
                                                                    share->record(), &acquired);
                      clReleaseEvent(acquired);
                  });
                  share->end();
                  return time;
              },
              Goal::extraNanoseconds(kLimit)}}};
}

// Deformers report their last events.
class EventReports {
public:
    static constexpr std::size_t kEvents = 64; // of each thread in an evaluation

    explicit EventReports(std::size_t threads)
        : fPair(threads == 2 ? std::make_unique<TwoThreads>() : nullptr)
    {
        fEvent.adopt(makeCompleteEvent());
    }

    Nanoseconds evaluate()
    {
        fShare.begin();
        const cl_event event = fEvent.get();
        const Nanoseconds time =
            onThreads([&] { fShare.manager().EnqueueReleaseBatchedSharedCLBuffer(1, &event); });
        fShare.end();
        return time;
    }

    Nanoseconds evaluateDirectly()
    {
        const Nanoseconds time = onThreads([&] {
            clRetainEvent(fEvent.get());
            fList.push_back(fEvent.get());
        });
        for (cl_event event : fList)
            clReleaseEvent(event);
        fList.clear();
        return time;
    }

private:
    template <typename Operation>
    Nanoseconds onThreads(const Operation& operation)
    {
        const auto work = [&](std::size_t) {
            for (std::size_t index = 0; index < kEvents; ++index)
                operation();
        };
        return fPair ? fPair->timedTogether(work) : timed([&] { work(0); });
    }

    StubbedBatch fShare{16};
    AutoCLObject<cl_event> fEvent;
    tbb::concurrent_vector<cl_event> fList;
    std::unique_ptr<TwoThreads> fPair; // null for one thread
};

Group reportEvents(const std::string& name, std::size_t threads)
{
    constexpr double kLimit = 1.2;
    const auto reports = std::make_shared<EventReports>(threads);
    const auto repeat = [reports](Nanoseconds (EventReports::*evaluate)()) {
        return [reports, evaluate](std::size_t frames) {
            Nanoseconds time{0};
            for (std::size_t frame = 0; frame < frames; ++frame)
                time += (*reports.*evaluate)();
            return time;
        };
    };
    return {name,
            {{"retain, push", repeat(&EventReports::evaluateDirectly), {}, EventReports::kEvents},
             {"EnqueueReleaseBatchedSharedCLBuffer", repeat(&EventReports::evaluate),
              Goal::ratio(kLimit), EventReports::kEvents}},
            threads > 1};
}

} // namespace

std::vector<GroupFactory> batchGroups(Runtime* runtime)
{
    std::vector<GroupFactory> groups;
    const auto add = [&groups](const std::string& name, auto make, auto... arguments) {
        groups.push_back({name, [=] { return make(name, arguments...); }});
    };
    for (const std::size_t count : {1u, 16u, 256u, 4096u}) {
        const std::string name = "evaluation of " + std::to_string(count) + " buffers";
        groups.push_back({name, [=] { return evaluation(name, *runtime, count); }});
    }
    for (const std::size_t count : {16u, 256u, 4096u})
        add("evaluation without interop, " + std::to_string(count) + " buffers", withoutInterop,
            count);
    add("batch rebuild, 4096 buffers", rebuild, std::size_t{4096});
    add("acquire of a batched buffer", acquireBatched);
    add("reporting events, 1 thread", reportEvents, std::size_t{1});
    add("reporting events, 2 threads", reportEvents, std::size_t{2});
    return groups;
}
