// The rules of NVIDIA driver versions. Internal.
#pragma once

#include <compare>
#include <optional>
#include <string>

struct DriverVersion {
    int major = 0;
    int minor = 0;

    // NOLINTNEXTLINE(modernize-use-nullptr): the check mistakes the generated comparison with 0.
    auto operator<=>(const DriverVersion&) const = default;
};

// Parses a text such as "361.92": three characters, a separator, two characters. Throws a standard
// exception if the text is too short or a part has no digits.
DriverVersion parseDriverVersion(const std::string& text);

// The features of a driver that work.
struct DriverVerdict {
    bool usable = false;        // outside the range of versions whose OpenCL fails
    bool implicitSync = false;  // implicit OpenCL-to-graphics synchronisation
    bool asyncReadback = false; // asynchronous read-back
};

// Returns the features that work in a driver of this version. `ignoreVersion` is the value of
// VYRA_OPENCL_IGNORE_DRIVER_VERSION if it is set: with 0 or more every driver is usable, and with
// more than 0 its implicit synchronisation works.
[[nodiscard]] DriverVerdict judgeDriver(const DriverVersion& version,
                                        std::optional<int> ignoreVersion);
