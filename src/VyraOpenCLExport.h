// The export macro of the library's public classes and functions.
#pragma once

#if defined(_WIN32)
#if defined(VYRA_OPENCL_BUILDING)
#define VYRA_OPENCL_API __declspec(dllexport)
#else
#define VYRA_OPENCL_API __declspec(dllimport)
#endif
#else
#define VYRA_OPENCL_API __attribute__((visibility("default")))
#endif
