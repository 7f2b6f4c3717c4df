// Windows only: the libraries that a process loads.
#include "LibraryTest.h"

#include "runtime/TopenCLInfo.h"

#include <filesystem>

#include <windows.h>

namespace {

namespace fs = std::filesystem;

// The file of a loaded module; of the program for null.
fs::path fileOf(const char* module)
{
    wchar_t file[MAX_PATH] = {};
    const HMODULE handle = GetModuleHandleA(module);
    return handle || !module ? fs::path(file, file + GetModuleFileNameW(handle, file, MAX_PATH))
                             : fs::path();
}

using Windows = LibraryTest;

} // namespace

TEST_F(Windows, OpenCLIsLoadedFromProgramFolder)
{
    EXPECT_EQ(fileOf("OpenCL.dll"), fileOf(nullptr).parent_path() / "OpenCL.dll");
    EXPECT_EQ(fileOf("vyra-opencl.dll").filename(), "vyra-opencl.dll");
    EXPECT_EQ(GetModuleHandleA("Qt6Gui.dll"), nullptr);
}
