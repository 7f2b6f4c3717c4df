# Toolchain: Windows programs from Debian, built with g++ and run under Wine. scripts/test-windows
# builds the libraries of which Debian has no Windows build into VYRA_WINDOWS_LIBRARIES.
set(CMAKE_SYSTEM_NAME Windows)
set(CMAKE_SYSTEM_PROCESSOR x86_64)

# The variant with std::thread.
set(CMAKE_C_COMPILER x86_64-w64-mingw32-gcc-posix)
set(CMAKE_CXX_COMPILER x86_64-w64-mingw32-g++-posix)
include(${CMAKE_CURRENT_LIST_DIR}/windows.cmake)
