// Formatting of values for the reports.
#pragma once

#include <string>
#include <vector>

#include <CL/cl.h>

namespace info {

std::string yesOrNo(bool value);
// "0x10de"
std::string hex(unsigned number);
// "'NVIDIA Corporation'"
std::string quoted(const std::string& text);
// "'one', 'two'"
std::string quotedList(const std::vector<std::string>& texts);
// "one, two"
std::string commaList(const std::vector<std::string>& texts);
// "GPU", "CPU", or "CPU and accelerator" for a device with both bits.
std::string deviceTypeName(cl_device_type type);

} // namespace info
