#include "baselines/ThirdPartyBaseline.h"

#include <utility>

void addThirdPartyBaselines(
    Group& group, const std::function<std::optional<Case>(const ThirdPartyBaseline&)>& make)
{
    const double operations = group.cases.front().operationsPerIteration;
    for (const ThirdPartyBaseline* library : thirdPartyBaselines()) {
        std::optional<Case> subject = make(*library);
        if (!subject)
            continue;
        subject->thirdParty = library->name();
        subject->name = subject->thirdParty + ": " + subject->name;
        subject->goal = {};
        subject->operationsPerIteration = operations;
        group.cases.push_back(std::move(*subject));
    }
}
