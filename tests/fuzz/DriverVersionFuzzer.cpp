// Fuzzes the reading of NVIDIA driver versions, and the decisions that follow from a version.
#include "Require.h"
#include "runtime/DriverVersion.h"

#include <cstdint>
#include <exception>
#include <optional>
#include <string>

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size)
{
    // Texts end at their first NUL, as everywhere in OpenCL.
    const std::string text(std::string(data, data + size).c_str());
    DriverVersion version;
    try {
        version = parseDriverVersion(text);
    } catch (const std::exception&) {
        return 0; // an unreadable version raises an exception of the standard library
    }
    const auto cautious = judgeDriver(version, std::nullopt);
    const auto trusting = judgeDriver(version, 1);
    require(trusting.usable && trusting.implicitSync);
    require(cautious.usable || version.major >= 361);
    require(!cautious.implicitSync || cautious.asyncReadback);
    require(judgeDriver(version, 0).usable && judgeDriver(version, -1).usable == cautious.usable);
    return 0;
}
