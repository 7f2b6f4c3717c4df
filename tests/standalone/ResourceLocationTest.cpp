#include <QProcess>
#include <QTemporaryDir>

#include <gtest/gtest.h>

#include <filesystem>
#include <string>

namespace {

namespace fs = std::filesystem;

// An installation of the library and of a program that prints what it answers.
TEST(ResourceLocation, IsInTheInstallationOrElseInTheSourceTree)
{
    const QTemporaryDir directory;
    const fs::path prefix = fs::canonical(directory.path().toStdString());
    const fs::path program = prefix / "bin" / "program";
    fs::create_directories(prefix / "bin");
    fs::create_directories(prefix / TEST_INSTALL_LIBDIR);
    fs::copy_file(TEST_PROGRAM, program);
    fs::copy_file(TEST_LIBRARY, prefix / TEST_INSTALL_LIBDIR / TEST_LIBRARY_SONAME);
    const auto answer = [&] {
        QProcess process;
        process.start(QString::fromStdString(program.string()), QStringList());
        EXPECT_TRUE(process.waitForFinished());
        return process.readAllStandardOutput().trimmed().toStdString();
    };

    EXPECT_EQ(answer(), TEST_SOURCE_RESOURCES) << "no resources are installed yet";
    const fs::path resources = prefix / TEST_INSTALL_DATADIR / "vyra-opencl";
    fs::create_directories(resources);
    EXPECT_EQ(answer(), resources.string());
}

} // namespace
