// The file name of the OpenCL library.
#pragma once

// The library is opened at run time by this name; nothing links it. Other code of the process that
// calls OpenCL opens the same file.
#if defined(_WIN32)
inline constexpr const char* kOpenCLLibraryName = "OpenCL.dll";
#else
inline constexpr const char* kOpenCLLibraryName = "libOpenCL.so.1";
#endif
