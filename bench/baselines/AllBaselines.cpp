// The list for a build with third-party baselines.
#include "baselines/AllBaselines.h"

const std::vector<const ThirdPartyBaseline*>& thirdPartyBaselines()
{
    static const std::vector<const ThirdPartyBaseline*> all{&boostCompute(), &openCV(),
                                                            &cppBindings()};
    return all;
}
