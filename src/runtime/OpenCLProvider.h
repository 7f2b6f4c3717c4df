// Vendors of OpenCL platforms.
#pragma once

// The class of a platform's vendor, for the rules that differ by vendor.
enum OpenCLProvider : int {
    kNVIDIAProvider = 0,  // "NVIDIA Corporation"
    kAMDProvider = 1,     // "Advanced Micro Devices, Inc."
    kIntelProvider = 2,   // "Intel(R) Corporation"
    kAppleProvider = 3,   // "Apple"
    kUnknownProvider = 4, // any other vendor, and no platform chosen yet
};
