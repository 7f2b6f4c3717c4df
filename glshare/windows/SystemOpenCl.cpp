#include "windows/SystemOpenCl.h"

#include "core/gl/LibraryFunctions.h"
#include "entry/EntryPoint.h"
#include "windows/OpenClFunctions.h"

#include <map>
#include <memory>
#include <mutex>
#include <string>
#include <utility>
#include <vector>

#include <windows.h>

namespace glshare {

namespace {

// Returns the full path: the file name alone would find this library.
std::string systemLibrary()
{
    std::string folder(MAX_PATH, '\0');
    folder.resize(GetSystemDirectoryA(folder.data(), MAX_PATH));
    return folder + "\\OpenCL.dll";
}

cl_icd_dispatch theSystem{};

using EventNotify = void(CL_CALLBACK*)(cl_event, cl_int, void*);
using MemoryNotify = void(CL_CALLBACK*)(cl_mem, void*);

struct EventCallback {
    cl_event event; // owned
    EventNotify notify;
    void* user;
};

// Runs on a thread of the system's pool.
void CALLBACK waitAndNotify(PTP_CALLBACK_INSTANCE /*instance*/, void* argument)
{
    const std::unique_ptr<EventCallback> callback(static_cast<EventCallback*>(argument));
    cl_int status = CL_COMPLETE;
    theSystem.clWaitForEvents(1, &callback->event);
    theSystem.clGetEventInfo(callback->event, CL_EVENT_COMMAND_EXECUTION_STATUS, sizeof status,
                             &status, nullptr);
    callback->notify(callback->event, status, callback->user);
    theSystem.clReleaseEvent(callback->event);
}

cl_int CL_API_CALL setEventCallback(cl_event event, cl_int /*status*/, EventNotify notify,
                                    void* user)
{
    auto callback = std::make_unique<EventCallback>(EventCallback{event, notify, user});
    if (const cl_int error = theSystem.clRetainEvent(event); error != CL_SUCCESS)
        return error;
    if (!TrySubmitThreadpoolCallback(waitAndNotify, callback.get(), nullptr)) {
        theSystem.clReleaseEvent(event);
        return CL_OUT_OF_RESOURCES;
    }
    static_cast<void>(callback.release()); // owned by waitAndNotify
    return CL_SUCCESS;
}

// The destructor callbacks of memory objects. Never destroyed: objects may be released at exit.
struct Destructors {
    std::mutex mutex; // guards the rest, and each last release
    std::map<cl_mem, std::vector<std::pair<MemoryNotify, void*>>> callbacks;

    static Destructors& get()
    {
        static auto* const theDestructors = new Destructors;
        return *theDestructors;
    }
};

cl_int CL_API_CALL setDestructorCallback(cl_mem memory, MemoryNotify notify, void* user)
{
    Destructors& destructors = Destructors::get();
    const std::scoped_lock lock(destructors.mutex);
    destructors.callbacks[memory].emplace_back(notify, user);
    return CL_SUCCESS;
}

cl_int CL_API_CALL releaseMemory(cl_mem memory)
{
    Destructors& destructors = Destructors::get();
    std::vector<std::pair<MemoryNotify, void*>> callbacks;
    {
        const std::scoped_lock lock(destructors.mutex);
        cl_uint references = 0;
        const auto found = destructors.callbacks.find(memory);
        if (found != destructors.callbacks.end() &&
            theSystem.clGetMemObjectInfo(memory, CL_MEM_REFERENCE_COUNT, sizeof references,
                                         &references, nullptr) == CL_SUCCESS &&
            references == 1) {
            callbacks = std::move(found->second);
            destructors.callbacks.erase(found);
        }
    }
    for (auto callback = callbacks.rbegin(); callback != callbacks.rend(); ++callback)
        callback->first(memory, callback->second);
    return theSystem.clReleaseMemObject(memory);
}

} // namespace

cl_icd_dispatch loadSystemOpenCl()
{
    const LibraryFunctions library(systemLibrary().c_str());
#define GLSHARE_FIND(function) static_cast<void>(library.find(theSystem.function, #function));
    GLSHARE_FUNCTIONS(GLSHARE_FIND)
#undef GLSHARE_FIND
    cl_icd_dispatch table = theSystem;
    table.clSetEventCallback = entryPoint<setEventCallback>;
    table.clSetMemObjectDestructorCallback = entryPoint<setDestructorCallback>;
    table.clReleaseMemObject = releaseMemory;
    return table;
}

} // namespace glshare
