// The rules of NVIDIA driver versions. Internal.
#pragma once

#include <compare>
#include <optional>
#include <string>

struct DriverVersion {
    int major = 0;
    int minor = 0;

    // NOLINTNEXTLINE(modernize-use-nullptr): meant is the zero that the compiler compares with.
    auto operator<=>(const DriverVersion&) const = default;
};

// Reads "361.92": the number in the first three characters and the one in the two behind the
// separator. Raises a standard exception when the text is too short or a part has no digits.
DriverVersion parseDriverVersion(const std::string& text);

// What a driver is good for.
struct DriverVerdict {
    bool usable = false;        // not in the range whose OpenCL fails
    bool implicitSync = false;  // its implicit OpenCL-to-graphics synchronisation holds
    bool asyncReadback = false; // its asynchronous read-back works
};

// `ignoreVersion` is the value of VYRA_OPENCL_IGNORE_DRIVER_VERSION where that is set: 0 and more
// accepts every driver, and more than 0 also trusts its implicit synchronisation.
DriverVerdict judgeDriver(const DriverVersion& version, std::optional<int> ignoreVersion);
