#include "windows/Direct3D11.h"

#include "core/api/Arguments.h"
#include "core/api/Devices.h"
#include "core/api/VariableNames.h"
#include "entry/EntryPoint.h"
#include "entry/EntryPoints.h"
#include "windows/Direct3D11Buffer.h"

#include <algorithm>
#include <array>
#include <cstdlib>
#include <exception>
#include <map>
#include <memory>
#include <mutex>
#include <span>
#include <string>
#include <vector>

#include <CL/cl_d3d11.h>

namespace glshare {

namespace {

struct SharedRecord {
    Direct3D11Buffer buffer;
    bool isAcquired = false;
};

// The contexts and memory objects that share. Never destroyed: objects may be released at exit.
struct Records {
    std::mutex mutex;                            // guards the rest
    std::map<cl_context, ID3D11Device*> devices; // the application's, which outlive their contexts
    std::map<cl_mem, std::shared_ptr<SharedRecord>> buffers;

    static Records& get()
    {
        static auto* const theRecords = new Records;
        return *theRecords;
    }
};

// The functions that installDirect3D11 has replaced.
cl_icd_dispatch previousTable{};

cl_int CL_API_CALL getDeviceIds(cl_platform_id platform, cl_d3d11_device_source_khr source,
                                void* object, cl_d3d11_device_set_khr set, cl_uint capacity,
                                cl_device_id* devices, cl_uint* count)
{
    if (source != CL_D3D11_DEVICE_KHR || object == nullptr)
        return CL_INVALID_VALUE;
    if (set != CL_PREFERRED_DEVICES_FOR_D3D11_KHR && set != CL_ALL_DEVICES_FOR_D3D11_KHR)
        return CL_INVALID_VALUE;
    const std::vector<cl_device_id> all = devicesOf(platform, CL_DEVICE_TYPE_ALL);
    if (all.empty())
        return CL_DEVICE_NOT_FOUND;
    if (devices != nullptr)
        std::copy_n(all.begin(), std::min<std::size_t>(all.size(), capacity), devices);
    if (count != nullptr)
        *count = static_cast<cl_uint>(all.size());
    return CL_SUCCESS;
}

void CL_CALLBACK onDestroyed(cl_mem memory, void* /*user*/)
{
    Records& records = Records::get();
    const std::scoped_lock lock(records.mutex);
    records.buffers.erase(memory);
}

// Adds the record of a new memory object; releases the object if that throws.
void addRecord(cl_mem memory, Direct3D11Buffer buffer)
{
    try {
        auto record = std::make_shared<SharedRecord>(SharedRecord{std::move(buffer)});
        const std::scoped_lock lock(Records::get().mutex);
        Records::get().buffers[memory] = std::move(record);
    } catch (...) {
        runtime().clReleaseMemObject(memory); // the only reference
        throw;
    }
    runtime().clSetMemObjectDestructorCallback(memory, onDestroyed, nullptr);
}

cl_mem CL_API_CALL createFromBuffer(cl_context context, cl_mem_flags flags, ID3D11Buffer* resource,
                                    cl_int* error)
{
    Records& records = Records::get();
    ID3D11Device* device = nullptr;
    {
        const std::scoped_lock lock(records.mutex);
        if (const auto found = records.devices.find(context); found != records.devices.end())
            device = found->second;
    }
    cl_int result = device == nullptr ? CL_INVALID_CONTEXT : CL_INVALID_D3D11_RESOURCE_KHR;
    std::optional<Direct3D11Buffer> buffer =
        device == nullptr ? std::nullopt : Direct3D11Buffer::create(device, resource);
    cl_mem memory = nullptr;
    if (buffer)
        memory = runtime().clCreateBuffer(context, flags, buffer->size(), nullptr, &result);
    if (memory != nullptr)
        addRecord(memory, std::move(*buffer));
    setError(error, result);
    return memory;
}

// Finds the records of all objects and marks them as acquired, or as released. On an error nothing
// is marked.
cl_int setAcquired(std::span<const cl_mem> memory, bool acquired,
                   std::vector<std::shared_ptr<SharedRecord>>& found)
{
    Records& records = Records::get();
    const std::scoped_lock lock(records.mutex);
    for (cl_mem object : memory) {
        const auto record = records.buffers.find(object);
        if (record == records.buffers.end())
            return CL_INVALID_MEM_OBJECT;
        if (record->second->isAcquired == acquired ||
            std::ranges::find(found, record->second) != found.end())
            return acquired ? CL_D3D11_RESOURCE_ALREADY_ACQUIRED_KHR
                            : CL_D3D11_RESOURCE_NOT_ACQUIRED_KHR;
        found.push_back(record->second);
    }
    for (const auto& record : found)
        record->isAcquired = acquired;
    return CL_SUCCESS;
}

[[nodiscard]] cl_int copy(cl_command_queue queue, cl_mem memory, Direct3D11Buffer& buffer,
                          bool toOpenCl)
{
    std::vector<std::byte> bytes(buffer.size());
    if (toOpenCl) {
        if (!buffer.read(bytes))
            return CL_OUT_OF_RESOURCES;
        return runtime().clEnqueueWriteBuffer(queue, memory, CL_TRUE, 0, bytes.size(), bytes.data(),
                                              0, nullptr, nullptr);
    }
    const cl_int error = runtime().clEnqueueReadBuffer(queue, memory, CL_TRUE, 0, bytes.size(),
                                                       bytes.data(), 0, nullptr, nullptr);
    if (error != CL_SUCCESS)
        return error;
    return buffer.write(bytes) ? CL_SUCCESS : CL_OUT_OF_RESOURCES;
}

// Waits for the wait list and copies; stops at the first failure.
cl_int copyAll(cl_command_queue queue, std::span<const cl_mem> memory,
               std::span<const std::shared_ptr<SharedRecord>> records,
               std::span<const cl_event> waitList, bool toOpenCl)
{
    cl_int error = CL_SUCCESS;
    if (!waitList.empty())
        error = runtime().clWaitForEvents(static_cast<cl_uint>(waitList.size()), waitList.data());
    for (std::size_t i = 0; error == CL_SUCCESS && i < records.size(); ++i)
        error = copy(queue, memory[i], records[i]->buffer, toOpenCl);
    return error;
}

template <bool acquired>
cl_int CL_API_CALL enqueue(cl_command_queue queue, cl_uint count, const cl_mem* memory,
                           cl_uint waitCount, const cl_event* waitList, cl_event* event)
{
    if (!isValidList(count, memory))
        return CL_INVALID_VALUE;
    if (!isValidList(waitCount, waitList))
        return CL_INVALID_EVENT_WAIT_LIST;
    const std::span objects(memory, count);
    std::vector<std::shared_ptr<SharedRecord>> records;
    if (const cl_int error = setAcquired(objects, acquired, records); error != CL_SUCCESS)
        return error;
    cl_int error = CL_OUT_OF_HOST_MEMORY;
    try {
        error = copyAll(queue, objects, records, {waitList, waitCount}, acquired);
        if (error == CL_SUCCESS)
            error = runtime().clEnqueueMarkerWithWaitList(queue, 0, nullptr, event);
    } catch (const std::exception&) {
        // `error` is CL_OUT_OF_HOST_MEMORY.
    }
    if (error != CL_SUCCESS) {
        const std::scoped_lock lock(Records::get().mutex);
        for (const auto& record : records)
            record->isAcquired = !acquired;
    }
    return error;
}

// Returns the list without its Direct3D device, and sets `device` if it has one.
std::vector<cl_context_properties> withoutDevice(const cl_context_properties* list,
                                                 ID3D11Device*& device)
{
    std::vector<cl_context_properties> others;
    for (; list != nullptr && *list != 0; list += 2) {
        if (list[0] == CL_CONTEXT_D3D11_DEVICE_KHR)
            device = reinterpret_cast<ID3D11Device*>(list[1]); // NOLINT(performance-no-int-to-ptr)
        else
            others.insert(others.end(), {list[0], list[1]});
    }
    others.push_back(0);
    return others;
}

cl_context CL_API_CALL createContext(const cl_context_properties* properties, cl_uint count,
                                     const cl_device_id* devices, entry::ContextNotify notify,
                                     void* user, cl_int* error)
{
    ID3D11Device* device = nullptr;
    const std::vector<cl_context_properties> others = withoutDevice(properties, device);
    cl_context context = previousTable.clCreateContext(
        device == nullptr ? properties : others.data(), count, devices, notify, user, error);
    // The handle may have an entry from an earlier context.
    Records& records = Records::get();
    const std::scoped_lock lock(records.mutex);
    records.devices.erase(context);
    try {
        if (context != nullptr && device != nullptr)
            records.devices[context] = device;
    } catch (...) {
        previousTable.clReleaseContext(context); // the only reference
        throw;
    }
    return context;
}

// Returns the suffix of the extension's function names that GLSHARE_D3D11 selects; empty for none.
std::string functionSuffix()
{
    const char* value = std::getenv(kDirect3D11Variable);
    const std::string_view setting = value == nullptr ? "khr" : value;
    if (setting == "0")
        return "";
    return setting == "nv" ? "NV" : "KHR";
}

void* CL_API_CALL findFunction(const char* name)
{
    void* own = name == nullptr ? nullptr : findDirect3D11Function(name);
    return own != nullptr ? own : previousTable.clGetExtensionFunctionAddress(name);
}

void* CL_API_CALL findFunctionForPlatform(cl_platform_id platform, const char* name)
{
    void* own = name == nullptr ? nullptr : findDirect3D11Function(name);
    return own != nullptr ? own
                          : previousTable.clGetExtensionFunctionAddressForPlatform(platform, name);
}

} // namespace

void installDirect3D11(cl_icd_dispatch& table)
{
    if (functionSuffix().empty())
        return;
    addExtension(functionSuffix() == "NV" ? "cl_nv_d3d11_sharing" : "cl_khr_d3d11_sharing");
    previousTable = table;
    table.clCreateContext = entryPoint<createContext>;
    table.clGetExtensionFunctionAddress = entryPoint<findFunction>;
    table.clGetExtensionFunctionAddressForPlatform = entryPoint<findFunctionForPlatform>;
}

void* findDirect3D11Function(std::string_view name)
{
    const std::array<std::pair<std::string, void*>, 4> functions{{
        {"clGetDeviceIDsFromD3D11" + functionSuffix(),
         reinterpret_cast<void*>(entryPoint<getDeviceIds>)},
        {"clCreateFromD3D11Buffer" + functionSuffix(),
         reinterpret_cast<void*>(entryPoint<createFromBuffer>)},
        {"clEnqueueAcquireD3D11Objects" + functionSuffix(),
         reinterpret_cast<void*>(entryPoint<enqueue<true>>)},
        {"clEnqueueReleaseD3D11Objects" + functionSuffix(),
         reinterpret_cast<void*>(entryPoint<enqueue<false>>)},
    }};
    for (const auto& [ownName, address] : functions) {
        if (ownName == name)
            return address;
    }
    return nullptr;
}

} // namespace glshare
