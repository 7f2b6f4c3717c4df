// What the library asks the host application itself.
#pragma once

#include "host/HostExport.h"
#include "host/Tstring.h"

class VYRA_HOST_API TappLocale {
public:
    // The directory of the application's resources, kernel sources among them.
    static Tstring getResourcesLocation();
};

class VYRA_HOST_API TresourceGuard {
public:
    // Called once, when OpenCL is up: the host notes how much device memory is taken already.
    static void initializeOffset();
};
