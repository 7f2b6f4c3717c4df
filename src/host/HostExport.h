// The export macro of the host's interfaces.
#pragma once

#if defined(_WIN32)
#if defined(VYRA_HOST_STATIC) // the host is linked into the module that calls it
#define VYRA_HOST_API
#elif defined(VYRA_HOST_BUILDING)
#define VYRA_HOST_API __declspec(dllexport)
#else
#define VYRA_HOST_API __declspec(dllimport)
#endif
#else
#define VYRA_HOST_API __attribute__((visibility("default")))
#endif
