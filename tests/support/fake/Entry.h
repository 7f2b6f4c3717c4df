// One call of an entry point, from taking the runtime's lock to its line in the log.
#pragma once

#include "fake/FakeRuntime.h"

#include <concepts>
#include <initializer_list>
#include <mutex>
#include <optional>
#include <string>
#include <utility>

namespace scripted {

// An array argument: its count and its pointer.
template <typename T>
struct List {
    cl_uint count;
    const T* items;
};
using WaitList = List<cl_event>;
using Mems = std::vector<cl_mem>;
// A property list that ends with 0.
struct PropertyList {
    const cl_context_properties* items;
};

// The status of a call is set by a planned fault or by misuse, which is also noted. A call that has
// a status does nothing, except retains and releases.
class Entry {
public:
    template <typename... Arguments>
    explicit Entry(const char* function, const Arguments&... arguments)
        : fRuntime(runtime()), fGuard(fRuntime.fLock), fLine(function)
    {
        begin(function, {text(arguments)...});
    }
    ~Entry();
    Entry(const Entry&) = delete;
    Entry& operator=(const Entry&) = delete;

    const Machine& machine() const { return fRuntime.fMachine; }
    const std::vector<cl_platform_id>& platforms() const { return fRuntime.fPlatforms; }
    const std::vector<cl_device_id>& devices() const { return fRuntime.fDevices; }
    const DeviceScript& script(const Object& device) const
    {
        return fRuntime.fDeviceScripts[device.index];
    }
    bool ok() const { return fStatus == CL_SUCCESS; }
    cl_int status() const { return fStatus; }
    bool withHandle() const { return fWithHandle; } // has its effect although it fails

    // Sets an error status that is not caused by misuse, such as a program that does not build.
    cl_int answerWith(cl_int status) { return fStatus = status; }
    // Notes misuse unless `holds`. Returns `holds`.
    bool require(bool holds, cl_int status, const std::string& note);
    // Returns the existing object, or null after noting misuse.
    Object* object(Kind kind, const void* handle);
    void requireWaitList(const WaitList& list);

    cl_int retain(Kind kind, const void* handle);
    cl_int release(Kind kind, const void* handle);
    // Appends text to the call's line in the log.
    template <typename T>
    void describe(const char* what, const List<T>& list)
    {
        fLine += what + text(list);
    }
    // Creates the call's result, unless the call has a status.
    template <typename T>
    T create(Kind kind)
    {
        return static_cast<T>(createHandle(kind));
    }
    // Returns the result of the call, with its status.
    template <typename T>
    T result(T handle, cl_int* error)
    {
        if (error)
            *error = fStatus;
        return handle;
    }
    // Returns the existing memory object that a command may use, or null; a shared one only if
    // acquired.
    Object* usableMem(cl_mem mem);
    // Ends an enqueued command: checks its queue, its wait list and the memory that it uses, and
    // creates its event if `event` is not null.
    cl_int command(cl_command_queue queue, const WaitList& list, cl_event* event,
                   const Mems& mems = {}, bool blocking = false);
    // Ends an enqueued acquire or release of these objects.
    cl_int changeSide(cl_command_queue queue, const WaitList& list, cl_event* event,
                      const std::vector<Object*>& objects, bool acquire);
    // Completes the commands before an event, or all commands of a queue.
    void waitFor(const Object& event) { fRuntime.fCommands.observe(event.command); }
    void waitForQueue(cl_command_queue queue) { fRuntime.fCommands.observeQueue(queue); }
    bool isPending(const Object& event) const
    {
        return fRuntime.fCommands.isPending(event.command);
    }
    // Returns the scripted result of the next shared buffer, kernel, or OpenGL client wait.
    std::optional<cl_mem> nextSharedMem() { return std::exchange(fRuntime.fNextSharedMem, {}); }
    cl_kernel nextKernel() { return std::exchange(fRuntime.fNextKernel, nullptr); }
    unsigned nextClientWait();
    void rememberNotify(ContextNotify notify) { fRuntime.fNotify = notify; }
    // Ends a query.
    cl_int answer(cl_uint query, const void* data, std::size_t size, std::size_t capacity,
                  void* value, std::size_t* sizeReturned);
    cl_int answer(cl_uint query, const std::string& data, std::size_t capacity, void* value,
                  std::size_t* sizeReturned)
    {
        return answer(query, data.c_str(), data.size() + 1, capacity, value, sizeReturned);
    }

private:
    std::string text(const void* handle) const { return fRuntime.name(handle); }
    std::string text(const char* characters) const { return std::string("\"") + characters + '"'; }
    std::string text(const PropertyList& list) const;
    std::string text(std::integral auto number) const { return std::to_string(number); }
    template <typename T>
    std::string text(const List<T>& list) const
    {
        if (!list.items)
            return list.count == 0 ? "[]" : std::to_string(list.count) + " of null";
        std::string names;
        for (cl_uint i = 0; i < list.count; ++i)
            names += (i ? ", " : "") + text(list.items[i]);
        return '[' + names + ']';
    }
    void begin(const char* function, std::initializer_list<std::string> arguments);
    void* createHandle(Kind kind);
    CommandOrder::Command nextCommand(cl_command_queue queue, const WaitList& list);
    unsigned addCommand(CommandOrder::Command command, cl_event* event);

    InsideRuntime fInside;
    FakeRuntime& fRuntime;
    std::scoped_lock<QuietLock> fGuard;
    std::string fLine;
    std::string fFunction;
    std::string fCreated;
    cl_int fStatus = CL_SUCCESS;
    bool fWithHandle = false;
    bool fEmptyHanded = false;
};

} // namespace scripted
