// Which vendor's platform the library runs on. Internal.
#pragma once

#include "host/Tstring.h"
#include "runtime/OpenCLProvider.h"

#include <optional>
#include <vector>

#include <CL/cl.h>

// Vendor names, as CL_PLATFORM_VENDOR gives them.
inline constexpr const char* kNVIDIAVendor = "NVIDIA Corporation";
inline constexpr const char* kAMDVendor = "Advanced Micro Devices, Inc.";
inline constexpr const char* kIntelVendor = "Intel(R) Corporation";
inline constexpr const char* kAppleVendor = "Apple";

// The vendor's name: VYRA_OPENCL_PLATFORM, else by the PCI vendor id of the renderer's adapter.
// Empty, and said on standard error, for an unknown id.
std::optional<Tstring> chooseVendor(unsigned vendorId);

// The class of the vendor of exactly that name.
OpenCLProvider providerOfVendor(const Tstring& vendor);

// Reads a text of a platform with its terminating NUL. Returns the failing call's status,
// unreported.
cl_int queryPlatformInfo(cl_platform_id platform, cl_platform_info name, std::vector<char>& value);

// The text in `value`, also when a runtime answered with nothing at all.
Tstring platformText(const std::vector<char>& value);
