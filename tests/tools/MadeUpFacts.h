// Facts of a machine that works, for tests to spoil.
#pragma once

#include "tools/Facts.h"

// One platform of `vendor` with one GPU that drives the renderer; start-up went through, in the
// modes that are automatic there.
info::Facts workingFacts(const char* vendor, OpenCLProvider provider);

info::Facts intelFacts();
info::Facts nvidiaFacts(const char* driverVersion);
