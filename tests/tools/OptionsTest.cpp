#include "tools/Options.h"

#include <gtest/gtest.h>

namespace {

using Arguments = std::vector<std::string>;

TEST(Options, AreReadInBothForms)
{
    std::string problem;
    const auto options = info::parseOptions(
        {"--platform=Some Vendor", "--device-vendor", "0X10DE", "--json"}, problem);
    ASSERT_TRUE(options) << problem;
    EXPECT_EQ(options->platform, "Some Vendor");
    EXPECT_EQ(options->deviceVendor, 0x10DEU);
    EXPECT_TRUE(options->json);
    EXPECT_EQ(info::parseOptions({"--device-vendor=0123"}, problem)->deviceVendor, 123U);
}

TEST(Options, WrongOnesAreRefusedWithAReason)
{
    const Arguments rows[] = {
        {"--platform"},
        {"--device-vendor"},
        {"--device-vendor", "10de"},
        {"--device-vendor="},
        {"--device-vendor=0x"},
        {"--device-vendor=-1"},
        {"--device-vendor=99999999999"},
        {"--json=1"},
        {"report"},
        {"--json", "--verbose"},
    };
    for (const Arguments& arguments : rows) {
        std::string problem;
        EXPECT_FALSE(info::parseOptions(arguments, problem)) << arguments.front();
        EXPECT_FALSE(problem.empty()) << arguments.front();
    }
}

} // namespace
