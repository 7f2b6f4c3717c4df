// The list for a build without third-party baselines.
#include "baselines/ThirdPartyBaseline.h"

const std::vector<const ThirdPartyBaseline*>& thirdPartyBaselines()
{
    static const std::vector<const ThirdPartyBaseline*> none;
    return none;
}
