// The command line.
#pragma once

#include <optional>
#include <string>

#include <QStringList>

namespace info {

struct Options {
    bool help = false;
    bool version = false;
    bool json = false;
    std::optional<std::string> platform;  // a vendor's name
    std::optional<unsigned> deviceVendor; // PCI vendor id
};

// Parses `arguments`, which begin with the program's name. Empty if they are wrong; `problem` then
// receives the reason.
[[nodiscard]] std::optional<Options> parseOptions(const QStringList& arguments,
                                                  std::string& problem);

// Returns the text of --help. Requires an application object.
[[nodiscard]] std::string helpText();

} // namespace info
