#include "host/Environment.h"

#include "Platform.h"

#include <gtest/gtest.h>

#include <cstdint>

namespace {

constexpr const char* variable = "VYRA_HOST_TEST_VARIABLE";
constexpr std::int32_t defaultValue = -77;

// Returns the value of the variable with this text.
std::int32_t read(const char* text)
{
    setEnvironment(variable, text);
    return TenvironmentVariable(variable).asInt32(defaultValue);
}

TEST(Environment, AsInt32ReadsWholeIntegersOnly)
{
    EXPECT_EQ(read("-42"), -42);
    EXPECT_EQ(read("2147483647"), INT32_MAX);
    EXPECT_EQ(read("-2147483648"), INT32_MIN);
    for (const char* text : {"42", "+42", "0042", " 42 ", "\t42\r\n"})
        EXPECT_EQ(read(text), 42) << text;
    for (const char* text :
         {"", "  ", "4 2", "42x", "x42", "4.0", "0x10", "+", "-", "+-1", "--1", "++1", "- 1",
          "true", "2147483648", "-2147483649", "99999999999999999999"})
        EXPECT_EQ(read(text), defaultValue) << text;
}

TEST(Environment, AsInt32ReturnsDefaultForMissingVariable)
{
    setEnvironment(variable, nullptr);
    EXPECT_EQ(VyraGetEnv(variable), nullptr);
    EXPECT_EQ(TenvironmentVariable(variable).asInt32(defaultValue), defaultValue);
#ifndef _WIN32 // setting the empty text removes a variable there
    setEnvironment(variable, "");
    EXPECT_STREQ(VyraGetEnv(variable), "");
#endif
}

} // namespace
