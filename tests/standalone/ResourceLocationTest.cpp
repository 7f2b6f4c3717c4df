#include "host/Application.h"

#include <gtest/gtest.h>

#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <memory>
#include <string>

namespace {

namespace fs = std::filesystem;

// An installation of the library and of a program that prints what it answers.
class InstalledHost : public testing::Test {
protected:
    void SetUp() override
    {
        std::string pattern = (fs::temp_directory_path() / "vyra-host-XXXXXX").string();
        ASSERT_NE(mkdtemp(pattern.data()), nullptr);
        fPrefix = fs::canonical(pattern);
        fs::create_directories(fPrefix / "bin");
        fs::create_directories(fPrefix / TEST_INSTALL_LIBDIR);
        fs::copy_file(TEST_PROGRAM, fPrefix / "bin" / "program");
        fs::copy_file(TEST_LIBRARY, fPrefix / TEST_INSTALL_LIBDIR / TEST_LIBRARY_SONAME);
    }

    void TearDown() override
    {
        if (!fPrefix.empty()) {
            fs::remove_all(fPrefix);
        }
    }

    // The program's line of output.
    std::string run() const
    {
        const std::string command = (fPrefix / "bin" / "program").string();
        const std::unique_ptr<FILE, int (*)(FILE*)> pipe(popen(command.c_str(), "r"), pclose);
        std::string line(4096, '\0');
        if (pipe == nullptr ||
            std::fgets(line.data(), static_cast<int>(line.size()), pipe.get()) == nullptr) {
            return {};
        }
        return line.substr(0, line.find('\n'));
    }

    fs::path fPrefix;
};

TEST(ResourceLocation, IsTheSourceTreeInABuild)
{
    EXPECT_STREQ(TappLocale::getResourcesLocation().asChar(), TEST_SOURCE_RESOURCES);
}

TEST_F(InstalledHost, FindsTheResourcesOfItsPrefix)
{
    EXPECT_EQ(run(), TEST_SOURCE_RESOURCES) << "no resources are installed yet";
    const fs::path resources = fPrefix / TEST_INSTALL_DATADIR / "vyra-opencl";
    fs::create_directories(resources);
    EXPECT_EQ(run(), resources.string());
}

} // namespace
