# Compiler settings that every target of the project shares: link `vyra::options` privately.
option(VYRA_WARNINGS_AS_ERRORS "Treat compiler warnings as errors" OFF)
option(VYRA_COVERAGE "Instrument for line and branch coverage" OFF)
set(VYRA_SANITIZE "" CACHE STRING "Sanitizers to build with, as -fsanitize takes them")

add_library(vyra_options INTERFACE)
add_library(vyra::options ALIAS vyra_options)
target_compile_features(vyra_options INTERFACE cxx_std_20)
if(MSVC)
    target_compile_options(vyra_options INTERFACE
        /W4 /permissive- /utf-8 /Zc:__cplusplus $<$<BOOL:${VYRA_WARNINGS_AS_ERRORS}>:/WX>)
    # std::getenv and its like are no mistake.
    target_compile_definitions(vyra_options INTERFACE _CRT_SECURE_NO_WARNINGS)
else()
    target_compile_options(vyra_options INTERFACE
        -Wall -Wextra -Wpedantic -Wshadow -Wconversion
        $<$<BOOL:${VYRA_WARNINGS_AS_ERRORS}>:-Werror>)
endif()
if(WIN32) # the system's header has macros of these names
    target_compile_definitions(vyra_options INTERFACE NOMINMAX)
endif()
# Qt's `emit` and `slots` macros break oneTBB's headers.
target_compile_definitions(vyra_options INTERFACE QT_NO_KEYWORDS)
# The library is written for version 1.2 of OpenCL.
target_compile_definitions(vyra_options INTERFACE
    CL_TARGET_OPENCL_VERSION=120 CL_USE_DEPRECATED_OPENCL_1_1_APIS)

set(VYRA_NO_UNDEFINED LINKER:--no-undefined)
if(VYRA_SANITIZE)
    # clang++ links the runtime libraries of sanitizers into programs only.
    set(VYRA_NO_UNDEFINED)
    add_compile_options(-fsanitize=${VYRA_SANITIZE} -fno-omit-frame-pointer -fno-sanitize-recover=all)
    add_link_options(-fsanitize=${VYRA_SANITIZE})
endif()
if(VYRA_COVERAGE)
    # Several threads update the counters at once.
    add_compile_options(--coverage -fprofile-update=atomic)
    add_link_options(--coverage)
endif()

# Debug information that names files relative to the project: equal in every clone, so that ccache can
# share the objects between them. A debugger that starts in the project's directory finds the files.
option(VYRA_RELATIVE_DEBUG_PATHS "Name source files in debug information relative to the project" OFF)
if(VYRA_RELATIVE_DEBUG_PATHS AND NOT MSVC)
    add_compile_options(-fdebug-prefix-map=${PROJECT_SOURCE_DIR}=.)
endif()

find_program(VYRA_CCACHE ccache)
if(VYRA_CCACHE AND NOT CMAKE_CXX_COMPILER_LAUNCHER)
    set(CMAKE_C_COMPILER_LAUNCHER ${VYRA_CCACHE})
    set(CMAKE_CXX_COMPILER_LAUNCHER ${VYRA_CCACHE})
endif()
