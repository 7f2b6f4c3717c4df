// The host application's resources and memory accounting.
#pragma once

#include "host/HostExport.h"
#include "host/Tstring.h"

class VYRA_HOST_API TappLocale {
public:
    // Returns the directory of the application's resources, which include kernel sources.
    static Tstring getResourcesLocation();
};

class VYRA_HOST_API TresourceGuard {
public:
    // Records how much device memory is in use. Called once, after OpenCL has started.
    static void initializeOffset();
};
