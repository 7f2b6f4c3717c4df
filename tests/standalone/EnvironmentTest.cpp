#include "host/Environment.h"

#include "Platform.h"

#include <gtest/gtest.h>

#include <cstdint>

namespace {

constexpr const char* kVariable = "VYRA_HOST_TEST_VARIABLE";
constexpr std::int32_t kDefaultValue = -77;

// Returns the value of the variable with this text.
std::int32_t read(const char* text)
{
    setEnvironment(kVariable, text);
    return TenvironmentVariable(kVariable).asInt32(kDefaultValue);
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
        EXPECT_EQ(read(text), kDefaultValue) << text;
}

TEST(Environment, AsInt32ReturnsDefaultForMissingVariable)
{
    setEnvironment(kVariable, nullptr);
    EXPECT_EQ(VyraGetEnv(kVariable), nullptr);
    EXPECT_EQ(TenvironmentVariable(kVariable).asInt32(kDefaultValue), kDefaultValue);
#ifndef _WIN32 // setting the empty text removes a variable there
    setEnvironment(kVariable, "");
    EXPECT_STREQ(VyraGetEnv(kVariable), "");
#endif
}

} // namespace
