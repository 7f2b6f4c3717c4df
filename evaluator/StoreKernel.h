// The owner of a kernel from the library's kernel store. Internal.
#pragma once

#include "diagnostics/AutoCLObject.h"
#include "kernels/TopenCLKernelStore.h"
#include "runtime/TopenCLInfo.h"

#include <utility>

#include <CL/cl.h>

namespace vyra {

// An owner that returns its kernel to the store of the runtime object on destruction. One object is
// used by one thread at a time.
class StoreKernel {
public:
    StoreKernel() = default;
    explicit StoreKernel(AutoCLObject<cl_kernel> kernel) noexcept : fKernel(std::move(kernel)) {}
    ~StoreKernel()
    {
        if (fKernel.get())
            TopenCLInfo::theOne().kernelStore().freeKernel(fKernel);
    }
    StoreKernel(StoreKernel&& other) noexcept = default;
    StoreKernel& operator=(StoreKernel&& other) noexcept
    {
        std::swap(fKernel, other.fKernel); // `other` destroys the former kernel
        return *this;
    }

    cl_kernel get() const noexcept { return fKernel.get(); }

private:
    AutoCLObject<cl_kernel> fKernel;
};

} // namespace vyra
