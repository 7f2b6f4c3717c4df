#include "Faults.h"

namespace scripted {

const Fault* Faults::meet(const std::string& function)
{
    const Fault* met = nullptr;
    for (Plan& plan : fPlans) {
        const Fault& fault = plan.fault;
        if (fault.function != "*" && fault.function != function)
            continue;
        ++plan.calls;
        if (plan.calls == fault.nth || (fault.onwards && plan.calls > fault.nth))
            met = &fault;
    }
    return met;
}

} // namespace scripted
