// Small programs to ask the kernel store for, and the same ones built by hand.
#pragma once

#include "host/TstringArray.h"

#include <filesystem>
#include <string>
#include <vector>

#include <CL/cl.h>

// What one caller asks for: a file, options and include directories of its own.
struct KernelRequest {
    std::string path;
    std::string flags;
    TstringArray includeDirs;

    static constexpr const char* kKernelName = "scale";
};

// The source files of a number of requests, on disk while the object lives, and a built program for
// each, which the store knows nothing of.
class Programs {
public:
    // Short: names and options of a few letters, no include directories. Long: what a large host
    // asks for.
    enum class Texts { kShort, kLong };

    Programs(std::size_t count, Texts texts);
    ~Programs();
    Programs(const Programs&) = delete;
    Programs& operator=(const Programs&) = delete;

    // What every file holds.
    static const char* source();
    // The flags and include directories of a request, as OpenCL takes them.
    static std::string buildOptions(const KernelRequest& request);

    const std::vector<KernelRequest>& requests() const { return fRequests; }
    // Owned by this object, one for each request.
    const std::vector<cl_program>& built() const { return fBuilt; }

private:
    std::filesystem::path fFolder;
    std::vector<KernelRequest> fRequests;
    std::vector<cl_program> fBuilt;
};
