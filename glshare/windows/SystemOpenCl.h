// The OpenCL.dll of the system.
#pragma once

#include "core/api/OpenCl.h"

namespace glshare {

// Loads the library and returns its functions. Missing functions are null, and so are all if there
// is no such library.
//
// Some systems' OpenCL.dll rejects callbacks, so they are implemented here. Event callbacks run on
// a thread that waits for the event. Destructor callbacks of a memory object run when the
// application releases its last reference.
[[nodiscard]] cl_icd_dispatch loadSystemOpenCl();

} // namespace glshare
