// Which calls of the scripted runtime fail, and how.
#pragma once

#include <string>
#include <vector>

#include <CL/cl.h>

namespace scripted {

// A plan for the calls of one function. Retains and releases that fail still count; everything else
// that fails does nothing, save for a create function `withHandle`.
struct Fault {
    std::string function; // "*": every function, OpenGL's included
    cl_int status = CL_OUT_OF_RESOURCES;
    unsigned nth = 1;        // the call that fails, counted from the moment of planning
    bool onwards = false;    // all later calls fail, too
    bool withHandle = false; // hands out an object together with the status
};

class Faults {
public:
    void plan(Fault fault) { fPlans.push_back({std::move(fault)}); }
    void clear() { fPlans.clear(); }
    // Counts a call of `function`; the fault that it meets, or null.
    const Fault* meet(const std::string& function);

private:
    struct Plan {
        Fault fault;
        unsigned calls = 0;
    };
    std::vector<Plan> fPlans;
};

} // namespace scripted
