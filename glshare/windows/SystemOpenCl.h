// The OpenCL.dll of the system, which ours stands in front of.
#pragma once

#include "core/api/OpenCl.h"

namespace glshare {

// Its functions; those that it lacks are null. Null, all of them, where there is none. Loads it.
//
// Some systems' OpenCL.dll refuses to call back. Then the callbacks for events and for memory
// objects that are destroyed are given here: the first on a thread that waits for the event, the
// second when the application lets its last reference go.
[[nodiscard]] cl_icd_dispatch loadSystemOpenCl();

} // namespace glshare
