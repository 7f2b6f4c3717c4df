// The interface of a test layer.
#pragma once

#undef CL_TARGET_OPENCL_VERSION
#define CL_TARGET_OPENCL_VERSION 300
#include <CL/cl_layer.h>

// Replaces functions of `table`. A layer without this function replaces none.
[[gnu::weak]] void changeTable(cl_icd_dispatch& table);
