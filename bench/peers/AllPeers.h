// One object for each peer, in the file of its name.
#pragma once

#include "peers/Peer.h"

const Peer& boostCompute();
const Peer& openCV();
const Peer& cppBindings();
