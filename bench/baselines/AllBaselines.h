// One object for each peer, in the file of its name.
#pragma once

#include "baselines/ThirdPartyBaseline.h"

const Peer& boostCompute();
const Peer& openCV();
const Peer& cppBindings();
