#include "cases/InteropStub.h"

#include "Runtime.h"

namespace {

cl_event completeEvent = nullptr;

cl_int CL_API_CALL answerAtOnce(cl_command_queue /*queue*/, cl_uint /*count*/,
                                const cl_mem* /*objects*/, cl_uint /*numEvents*/,
                                const cl_event* /*waitList*/, cl_event* event)
{
    clRetainEvent(completeEvent);
    *event = completeEvent;
    return CL_SUCCESS;
}

cl_mem CL_API_CALL shareAgain(cl_context /*context*/, cl_mem_flags /*flags*/, void* resource,
                              cl_int* error)
{
    const cl_mem memory = *static_cast<cl_mem*>(resource);
    *error = clRetainMemObject(memory);
    return memory;
}

// One of the two calls while it is counted.
struct CountedCall {
    EnqueueSharedObjects original = nullptr;
    std::size_t calls = 0;
};
CountedCall countedAcquire;
CountedCall countedRelease;

template <CountedCall& call>
cl_int CL_API_CALL countAndPassOn(cl_command_queue queue, cl_uint count, const cl_mem* objects,
                                  cl_uint numEvents, const cl_event* waitList, cl_event* event)
{
    ++call.calls;
    return call.original(queue, count, objects, numEvents, waitList, event);
}

} // namespace

InteropStub::InteropStub()
    : fCreate(sfCreateSharedCLBuffer), fAcquire(sfEnqueueAcquireSharedObjects),
      fRelease(sfEnqueueReleaseSharedObjects)
{
    cl_int status = CL_SUCCESS;
    completeEvent = clCreateUserEvent(Runtime::context(), &status);
    clSetUserEventStatus(completeEvent, CL_COMPLETE);
    sfCreateSharedCLBuffer = shareAgain;
    sfEnqueueAcquireSharedObjects = answerAtOnce;
    sfEnqueueReleaseSharedObjects = answerAtOnce;
}

InteropStub::~InteropStub()
{
    sfCreateSharedCLBuffer = fCreate;
    sfEnqueueAcquireSharedObjects = fAcquire;
    sfEnqueueReleaseSharedObjects = fRelease;
    clReleaseEvent(completeEvent);
}

InteropCounter::InteropCounter()
{
    countedAcquire = {sfEnqueueAcquireSharedObjects, 0};
    countedRelease = {sfEnqueueReleaseSharedObjects, 0};
    sfEnqueueAcquireSharedObjects = countAndPassOn<countedAcquire>;
    sfEnqueueReleaseSharedObjects = countAndPassOn<countedRelease>;
}

InteropCounter::~InteropCounter()
{
    sfEnqueueAcquireSharedObjects = countedAcquire.original;
    sfEnqueueReleaseSharedObjects = countedRelease.original;
}

std::size_t InteropCounter::acquires()
{
    return countedAcquire.calls;
}

std::size_t InteropCounter::releases()
{
    return countedRelease.calls;
}
