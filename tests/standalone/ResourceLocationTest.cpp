#include <gtest/gtest.h>

#include <cstdlib>
#include <filesystem>
#include <fstream>
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
    const auto answer = [&] {
        const std::string output = (prefix / "output").string();
        EXPECT_EQ(std::system((program.string() + " > " + output).c_str()), 0);
        std::string line;
        std::ifstream file(output);
        std::getline(file, line);
        return line;
    };

    EXPECT_EQ(answer(), TEST_SOURCE_RESOURCES) << "no resources are installed yet";
    const fs::path resources = prefix / TEST_INSTALL_DATADIR / "vyra-opencl";
    fs::create_directories(resources);
    EXPECT_EQ(answer(), resources.string());
    fs::remove_all(prefix);
}

} // namespace
