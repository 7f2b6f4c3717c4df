// Names and meanings of OpenCL status codes.
#pragma once

#include <string>

namespace info {

// Returns the code's name. Empty if no OpenCL header has one.
std::string statusName(int code);
// Returns the meaning of the code as a phrase. Empty if its name is sufficient.
std::string statusMeaning(int code);
// Returns name, number and meaning: "CL_OUT_OF_RESOURCES (-5): the device ran out of memory or of
// other resources".
std::string describeStatus(int code);

} // namespace info
