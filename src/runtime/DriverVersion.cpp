#include "runtime/DriverVersion.h"

namespace {

// The range of drivers whose OpenCL fails, both ends included.
constexpr DriverVersion kFirstUnusable{361, 92};
constexpr DriverVersion kLastUnusable{368, 85};
constexpr DriverVersion kFirstWithAsyncReadback{359, 91};
constexpr DriverVersion kFirstWithImplicitSync{385, 31};

} // namespace

DriverVersion parseDriverVersion(const std::string& text)
{
    DriverVersion version;
    version.major = std::stoi(text.substr(0, 3));
    version.minor = std::stoi(text.substr(4, 2));
    return version;
}

DriverVerdict judgeDriver(const DriverVersion& version, std::optional<int> ignoreVersion)
{
    const int ignore = ignoreVersion.value_or(-1);
    DriverVerdict verdict;
    verdict.usable = ignore >= 0 || version < kFirstUnusable || version > kLastUnusable;
    verdict.implicitSync = ignore > 0 || version >= kFirstWithImplicitSync;
    verdict.asyncReadback = version >= kFirstWithAsyncReadback;
    return verdict;
}
