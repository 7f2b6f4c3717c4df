#include "baselines/ThirdPartyBaseline.h"

#include <utility>

void addPeers(Group& group, const std::function<std::optional<Case>(const Peer&)>& make)
{
    const double operations = group.cases.front().operationsPerIteration;
    for (const Peer* peer : peers()) {
        std::optional<Case> subject = make(*peer);
        if (!subject)
            continue;
        subject->peer = peer->name();
        subject->name = subject->peer + ": " + subject->name;
        subject->goal = {};
        subject->operationsPerIteration = operations;
        group.cases.push_back(std::move(*subject));
    }
}
