# The common part of the Windows toolchains.
set(VYRA_WINDOWS_LIBRARIES ${CMAKE_CURRENT_LIST_DIR}/../../build/windows-libraries CACHE PATH
    "Where scripts/test-windows has put headers and libraries")
# Compiler checks are separate projects, and need it too.
list(APPEND CMAKE_TRY_COMPILE_PLATFORM_VARIABLES VYRA_WINDOWS_LIBRARIES)
cmake_path(NORMAL_PATH VYRA_WINDOWS_LIBRARIES)

set(CMAKE_RC_COMPILER x86_64-w64-mingw32-windres)
# Programs need no DLLs of the compiler.
set(CMAKE_EXE_LINKER_FLAGS_INIT -static)
set(CMAKE_SHARED_LINKER_FLAGS_INIT -static)

# Never use headers and libraries of the build machine.
set(CMAKE_FIND_ROOT_PATH ${VYRA_WINDOWS_LIBRARIES} /usr/x86_64-w64-mingw32)
set(CMAKE_FIND_ROOT_PATH_MODE_PROGRAM NEVER)
set(CMAKE_FIND_ROOT_PATH_MODE_LIBRARY ONLY)
set(CMAKE_FIND_ROOT_PATH_MODE_INCLUDE ONLY)
set(CMAKE_FIND_ROOT_PATH_MODE_PACKAGE ONLY)
# Debian has no Windows build of Qt: use one from elsewhere, or FindQt6.cmake's replacement.
set(VYRA_WINDOWS_QT "" CACHE PATH "Where a Qt for Windows is, and what else the viewer needs")
list(APPEND CMAKE_TRY_COMPILE_PLATFORM_VARIABLES VYRA_WINDOWS_QT)
if(VYRA_WINDOWS_QT)
    list(APPEND CMAKE_FIND_ROOT_PATH ${VYRA_WINDOWS_QT})
else()
    list(APPEND CMAKE_MODULE_PATH ${CMAKE_CURRENT_LIST_DIR})
endif()

set(CMAKE_CROSSCOMPILING_EMULATOR
    ${CMAKE_CURRENT_LIST_DIR}/run-with-wine ${VYRA_WINDOWS_LIBRARIES} ${CMAKE_BINARY_DIR}/bin)
