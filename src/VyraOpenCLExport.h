// The export macro of the library's public classes and functions.
#pragma once

#if defined(_WIN32)
#if defined(VYRA_OPENCL_STATIC) // the library's objects are linked into the module that calls them
#define VYRA_OPENCL_API
#elif defined(VYRA_OPENCL_BUILDING)
#define VYRA_OPENCL_API __declspec(dllexport)
#else
#define VYRA_OPENCL_API __declspec(dllimport)
#endif
#else
#define VYRA_OPENCL_API __attribute__((visibility("default")))
#endif
