// OpenCL status codes for readers: number, name and meaning.
#pragma once

#include <optional>
#include <string>

namespace info {

// The code's name; empty when no header that we know of names it.
std::string statusName(int code);
// What the code says about the machine, as a phrase. Empty when we have nothing to add to its name.
std::string statusMeaning(int code);
// "CL_OUT_OF_RESOURCES (-5): the device ran out of memory or of other resources".
std::string describeStatus(int code);

// The status in a warning such as "OpenCL error: CL_OUT_OF_RESOURCES"; empty for other warnings.
std::optional<int> statusInWarning(const std::string& warning);

} // namespace info
