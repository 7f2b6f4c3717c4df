// What a layer for tests does.
#pragma once

#undef CL_TARGET_OPENCL_VERSION
#define CL_TARGET_OPENCL_VERSION 300
#include <CL/cl_layer.h>

// Puts functions in front of those in `table`. A layer without this function changes nothing.
[[gnu::weak]] void changeTable(cl_icd_dispatch& table);
