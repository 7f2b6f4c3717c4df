// The list for a build with peers.
#include "peers/AllPeers.h"

const std::vector<const Peer*>& peers()
{
    static const std::vector<const Peer*> all{&boostCompute(), &openCV(), &cppBindings()};
    return all;
}
