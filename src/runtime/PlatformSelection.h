// The choice of the platform. Internal.
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

// Returns the vendor's name: the value of VYRA_OPENCL_PLATFORM if it is set, else the vendor with
// the PCI id `vendorId`. Empty for an unknown id, which is reported on standard error.
[[nodiscard]] std::optional<Tstring> chooseVendor(unsigned vendorId);

// Returns the provider with exactly this vendor name, or kUnknownProvider.
OpenCLProvider providerOfVendor(const Tstring& vendor);

// Reads a text of a platform with its terminating NUL. Returns the status of the first call that
// fails, without reporting it.
[[nodiscard]] cl_int queryPlatformInfo(cl_platform_id platform, cl_platform_info name,
                                       std::vector<char>& value);

// Returns the text in `value` up to its first NUL; the empty string if `value` is empty.
Tstring platformText(const std::vector<char>& value);
