#include "host/Environment.h"

#include <charconv>
#include <cstdlib>
#include <string_view>
#include <system_error>

namespace {

// Blanks around a number are allowed: in some shells `set NAME=1 && ...` sets "1 ".
std::string_view trimmed(std::string_view text)
{
    constexpr std::string_view blanks = " \t\r\n";
    const std::size_t first = text.find_first_not_of(blanks);
    if (first == std::string_view::npos) {
        return {};
    }
    return text.substr(first, text.find_last_not_of(blanks) - first + 1);
}

} // namespace

const char* VyraGetEnv(const char* name)
{
    return std::getenv(name);
}

TenvironmentVariable::TenvironmentVariable(const char* name) : fName(name) {}

std::int32_t TenvironmentVariable::asInt32(std::int32_t defaultValue) const
{
    const char* value = VyraGetEnv(fName);
    if (value == nullptr) {
        return defaultValue;
    }
    std::string_view digits = trimmed(value);
    // std::from_chars rejects a plus sign.
    if (digits.starts_with('+') && !digits.starts_with("+-")) {
        digits.remove_prefix(1);
    }
    std::int32_t number = 0;
    const char* const end = digits.data() + digits.size();
    const auto [parsed, error] = std::from_chars(digits.data(), end, number);
    return error == std::errc() && parsed == end ? number : defaultValue;
}
