// The kernels of the deformers, from files that may change while the viewer runs.
#pragma once

#include "diagnostics/AutoCLObject.h"
#include "viewer/OpenCLFunctions.h"

#include <cstddef>
#include <map>
#include <optional>
#include <string>

#include <CL/cl.h>

namespace viewer {

// Hands out kernels of the kernel store. Each file has one kernel and stands for the last text of
// it that built: a text that replaces it is a program of its own, so that the former one serves on
// until the new one is known to be good. Needs the library to be valid; one thread at a time uses
// an object.
class KernelFiles {
public:
    explicit KernelFiles(const OpenCLFunctions& cl) : fCL(cl) {}
    ~KernelFiles();
    KernelFiles(const KernelFiles&) = delete;
    KernelFiles& operator=(const KernelFiles&) = delete;

    // The folder with the kernel files.
    static std::string folder();

    // A new kernel `name` of the file `file` in that folder; empty if the file cannot be read or
    // does not build. The caller gives it back to the kernel store.
    AutoCLObject<cl_kernel> kernel(const std::string& file, const std::string& name);
    // Warnings of all requests that returned an empty kernel, with the build logs.
    const std::string& warnings() const { return fWarnings; }

    // From now on the file stands for this text, unless the text does not build or its kernel
    // takes another number of arguments: then returns the error, with the build log. Kernels
    // handed out stay what they are. Ignores a file that was never requested.
    std::optional<std::string> replace(const std::string& file, const std::string& source);

    std::size_t programsBuilt() const { return fProgramsBuilt; }
    std::size_t kernelsServed() const { return fKernelsServed; }

private:
    struct File {
        std::string kernelName;
        std::string programName; // in the store; empty: the text is the one on the disk
        std::string source;
        cl_uint arguments = 0;
        // Keeps a program that replaced another, also while no deformer has a kernel of it yet.
        AutoCLObject<cl_kernel> keeper;
    };

    struct NewKernel {
        AutoCLObject<cl_kernel> kernel;
        std::string warnings; // of its request
    };

    static NewKernel create(const std::string& name, const File& file);
    std::optional<std::string> error(const std::string& name, const File& file,
                                     const NewKernel& created) const;
    cl_uint argumentCount(cl_kernel kernel) const;

    const OpenCLFunctions& fCL;
    std::map<std::string, File> fFiles;
    std::string fWarnings;
    int fReplacements = 0; // tried
    std::size_t fProgramsBuilt = 0;
    std::size_t fKernelsServed = 0;
};

} // namespace viewer
