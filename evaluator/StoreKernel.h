// The owner of a kernel from the library's kernel store. Internal.
#pragma once

#include "diagnostics/AutoCLObject.h"
#include "kernels/TopenCLKernelStore.h"
#include "runtime/TopenCLInfo.h"

#include <utility>

#include <CL/cl.h>

namespace vyra {

// Gives the kernel back to the store of the runtime object when it goes. One thread at a time uses
// an object.
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
        std::swap(fKernel, other.fKernel); // the former kernel goes with `other`
        return *this;
    }

    cl_kernel get() const { return fKernel.get(); }

private:
    AutoCLObject<cl_kernel> fKernel;
};

} // namespace vyra
