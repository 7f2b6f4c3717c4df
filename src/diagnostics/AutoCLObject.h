// The owner of one reference to an OpenCL object.
#pragma once

#include "VyraOpenCLExport.h"

#include <CL/cl.h>

// Retain or release one reference to an OpenCL object. A status other than CL_SUCCESS, such as that
// for a null handle, is reported as a warning and otherwise ignored.
VYRA_OPENCL_API void retainCLObject(cl_mem handle);
VYRA_OPENCL_API void releaseCLObject(cl_mem handle);
VYRA_OPENCL_API void retainCLObject(cl_event handle);
VYRA_OPENCL_API void releaseCLObject(cl_event handle);
VYRA_OPENCL_API void retainCLObject(cl_kernel handle);
VYRA_OPENCL_API void releaseCLObject(cl_kernel handle);
VYRA_OPENCL_API void retainCLObject(cl_program handle);
VYRA_OPENCL_API void releaseCLObject(cl_program handle);

// An owner of exactly one reference to an OpenCL object, or of none when it is empty. Copies share
// the object, each with a reference of its own. `T` is cl_mem, cl_event, cl_kernel or cl_program.
//
// A holder has the size and layout of its handle: its address can be passed to OpenCL as the
// address of one handle, and an array of holders as an array of handles.
//
// One holder is used by one thread at a time; different holders of one object may be used on
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

    // Releases this holder's object, then retains the other's. Makes no call if both are the same.
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

    // Exchanges the two handles: the previous object of this holder is released by `other`.
    AutoCLObject& operator=(AutoCLObject&& other) noexcept
    {
        T previous = fHandle;
        fHandle = other.fHandle;
        other.fHandle = previous;
        return *this;
    }

    // Takes over the caller's reference to `handle`, such as the one that a create function
    // returns; null empties the holder. Does nothing if the holder has this handle already.
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

    // Empties the holder and returns the address of its handle, for an OpenCL call that returns an
    // object through an out-parameter. The holder owns the reference that the call writes.
    T* receive()
    {
        reset();
        return &fHandle;
    }

    // Returns the handle, or null if the holder is empty. The reference stays the holder's.
    T get() const noexcept { return fHandle; }

private:
    T fHandle = nullptr;
};

static_assert(sizeof(AutoCLObject<cl_mem>) == sizeof(cl_mem));
static_assert(sizeof(AutoCLObject<cl_event>) == sizeof(cl_event));

// Returns the address of a holder's handle, or of the handles of an array of holders.
template <typename T>
const T* rawHandles(const AutoCLObject<T>* holders)
{
    return reinterpret_cast<const T*>(holders);
}
