// Vendors of OpenCL platforms.
#pragma once

// The vendor of a platform, for the rules that depend on it.
enum OpenCLProvider : int {
    kNVIDIAProvider = 0,  // "NVIDIA Corporation"
    kAMDProvider = 1,     // "Advanced Micro Devices, Inc."
    kIntelProvider = 2,   // "Intel(R) Corporation"
    kAppleProvider = 3,   // "Apple"
    kUnknownProvider = 4, // any other vendor, or no platform chosen
};
