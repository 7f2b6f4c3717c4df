// The list for a build with peers.
#include "baselines/AllBaselines.h"

const std::vector<const Peer*>& peers()
{
    static const std::vector<const Peer*> all{&boostCompute(), &openCV(), &cppBindings()};
    return all;
}
