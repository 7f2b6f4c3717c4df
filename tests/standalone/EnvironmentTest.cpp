#include "host/Environment.h"

#include <gtest/gtest.h>

#include <cstdlib>
#include <limits>

namespace {

constexpr const char* variable = "VYRA_HOST_TEST_VARIABLE";
constexpr std::int32_t defaultValue = -77;

struct IntegerRow {
    const char* text; // null: the variable is not set
    std::int32_t expected;
};

TEST(Environment, ReadsWholeIntegersAndNothingElse)
{
    const IntegerRow rows[] = {
        {nullptr, defaultValue},
        {"", defaultValue},
        {"  ", defaultValue},
        {"0", 0},
        {"42", 42},
        {"-42", -42},
        {"+42", 42},
        {"007", 7},
        {" 42 ", 42},
        {"\t42\r\n", 42},
        {"4 2", defaultValue},
        {"42x", defaultValue},
        {"x42", defaultValue},
        {"4.0", defaultValue},
        {"0x10", defaultValue},
        {"+", defaultValue},
        {"-", defaultValue},
        {"+-1", defaultValue},
        {"--1", defaultValue},
        {"++1", defaultValue},
        {"- 1", defaultValue},
        {"true", defaultValue},
        {"2147483647", std::numeric_limits<std::int32_t>::max()},
        {"-2147483648", std::numeric_limits<std::int32_t>::min()},
        {"2147483648", defaultValue},
        {"-2147483649", defaultValue},
        {"99999999999999999999", defaultValue},
    };
    for (const IntegerRow& row : rows) {
        SCOPED_TRACE(row.text != nullptr ? row.text : "(not set)");
        if (row.text != nullptr) {
            setenv(variable, row.text, 1);
        } else {
            unsetenv(variable);
        }
        EXPECT_EQ(TenvironmentVariable(variable).asInt32(defaultValue), row.expected);
    }
}

TEST(Environment, TellsAnEmptyVariableFromAMissingOne)
{
    unsetenv(variable);
    EXPECT_EQ(VyraGetEnv(variable), nullptr);
    setenv(variable, "", 1);
    EXPECT_STREQ(VyraGetEnv(variable), "");
}

} // namespace
