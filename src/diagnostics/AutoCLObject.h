// The owner of one reference to an OpenCL object.
#pragma once

#include "VyraOpenCLExport.h"

#include <CL/cl.h>

// The runtime's reference counting, one pair per kind of handle. A status other than CL_SUCCESS is
// reported as a warning and otherwise ignored, also the one that the runtime gives for a null
// handle.
VYRA_OPENCL_API void retainCLObject(cl_mem handle);
VYRA_OPENCL_API void releaseCLObject(cl_mem handle);
VYRA_OPENCL_API void retainCLObject(cl_event handle);
VYRA_OPENCL_API void releaseCLObject(cl_event handle);
VYRA_OPENCL_API void retainCLObject(cl_kernel handle);
VYRA_OPENCL_API void releaseCLObject(cl_kernel handle);
VYRA_OPENCL_API void retainCLObject(cl_program handle);
VYRA_OPENCL_API void releaseCLObject(cl_program handle);

// Owns exactly one reference to the object of its handle while it is not empty. Copies share the
// object, each with a reference of its own. `T` is cl_mem, cl_event, cl_kernel or cl_program.
//
// A holder has the size and layout of its bare handle, so its address serves where OpenCL wants the
// address of one handle, and an array of holders where it wants an array of handles.
//
// One holder belongs to one thread at a time; different holders of one object may live and die on
// different threads.
template <typename T>
class AutoCLObject {
public:
    AutoCLObject() = default;

    AutoCLObject(const AutoCLObject& other) : fHandle(other.fHandle)
    {
        if (fHandle)
            retainCLObject(fHandle);
    }

    AutoCLObject(AutoCLObject&& other) noexcept : fHandle(other.fHandle)
    {
        other.fHandle = nullptr;
    }

    ~AutoCLObject()
    {
        if (fHandle)
            releaseCLObject(fHandle);
    }

    // Releases the own object, then retains the other's. Makes no call when both hold the same one.
    AutoCLObject& operator=(const AutoCLObject& other)
    {
        if (this == &other || fHandle == other.fHandle)
            return *this;
        if (fHandle)
            releaseCLObject(fHandle);
        if (other.fHandle)
            retainCLObject(other.fHandle);
        fHandle = other.fHandle;
        return *this;
    }

    // Exchanges the two handles: the former object of this holder is released with `other`.
    AutoCLObject& operator=(AutoCLObject&& other) noexcept
    {
        T former = fHandle;
        fHandle = other.fHandle;
        other.fHandle = former;
        return *this;
    }

    // Takes over the reference that the caller owns to `handle`, such as the one that a create
    // function returns; null empties the holder. Does nothing when it is the handle held already.
    void adopt(T handle)
    {
        if (handle == fHandle)
            return;
        if (fHandle)
            releaseCLObject(fHandle);
        fHandle = handle;
    }

    // Releases the object and leaves the holder empty.
    void reset()
    {
        if (fHandle)
            releaseCLObject(fHandle);
        fHandle = nullptr;
    }

    // Empties the holder and returns the address of its handle, for an OpenCL call that creates an
    // object through an out-parameter. What the call writes there belongs to the holder.
    T* receive()
    {
        reset();
        return &fHandle;
    }

    // The handle, or null when the holder is empty. No reference is handed out.
    T get() const { return fHandle; }

private:
    T fHandle = nullptr;
};

static_assert(sizeof(AutoCLObject<cl_mem>) == sizeof(cl_mem));
static_assert(sizeof(AutoCLObject<cl_event>) == sizeof(cl_event));
