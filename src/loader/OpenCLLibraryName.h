// The file name of the OpenCL library.
#pragma once

// The library that the system's loader finds by this name is opened at run time; nothing links it.
// Code that calls OpenCL next to this library opens the same one.
#if defined(_WIN32)
inline constexpr const char* kOpenCLLibraryName = "OpenCL.dll";
#else
inline constexpr const char* kOpenCLLibraryName = "libOpenCL.so.1";
#endif
