// The command line.
#pragma once

#include <optional>
#include <string>
#include <vector>

namespace info {

struct Options {
    bool help = false;
    bool version = false;
    bool json = false;
    std::optional<std::string> platform;  // a vendor's name
    std::optional<unsigned> deviceVendor; // PCI vendor id
};

// `arguments` are those behind the program's name. Empty when they are wrong; `problem` then says
// how, in one sentence.
std::optional<Options> parseOptions(const std::vector<std::string>& arguments,
                                    std::string& problem);

// The text of --help.
const char* helpText();

} // namespace info
