#include "Platform.h"

#include <gtest/gtest.h>

#include <filesystem>
#include <random>
#include <string>

namespace {

namespace fs = std::filesystem;

// An installation of the library and of a program that prints its resource directory.
TEST(ResourceLocation, IsInInstallationElseInSourceTree)
{
    const fs::path prefix = fs::canonical(fs::temp_directory_path()) /
                            ("vyra-resources-" + std::to_string(std::random_device()()));
    const fs::path program = prefix / "bin" / fs::path(TEST_PROGRAM).filename();
    fs::create_directories(program.parent_path());
    fs::create_directories(prefix / TEST_INSTALL_LIBDIR);
    fs::copy_file(TEST_PROGRAM, program);
    fs::copy_file(TEST_LIBRARY, prefix / TEST_INSTALL_LIBDIR / TEST_LIBRARY_NAME);
    const auto answer = [&program] { return outputOf(program.string()); };

    EXPECT_EQ(answer(), TEST_SOURCE_RESOURCES) << "no resources are installed yet";
    const fs::path resources = prefix / TEST_INSTALL_DATADIR / "vyra-opencl";
    fs::create_directories(resources);
    EXPECT_EQ(answer(), resources.string());
    fs::remove_all(prefix);
}

} // namespace
