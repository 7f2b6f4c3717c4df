// The third-party libraries; each is implemented in the file of its name.
#pragma once

#include "baselines/ThirdPartyBaseline.h"

const ThirdPartyBaseline& boostCompute();
const ThirdPartyBaseline& openCV();
const ThirdPartyBaseline& cppBindings();
