# Toolchain: as mingw.cmake, with clang instead of g++.
set(CMAKE_SYSTEM_NAME Windows)
set(CMAKE_SYSTEM_PROCESSOR x86_64)

set(CMAKE_C_COMPILER clang)
set(CMAKE_CXX_COMPILER clang++)
set(CMAKE_C_COMPILER_TARGET x86_64-w64-mingw32)
set(CMAKE_CXX_COMPILER_TARGET x86_64-w64-mingw32)
# clang does not recognise Debian's name for the folder of g++'s libraries.
execute_process(COMMAND x86_64-w64-mingw32-g++-posix -print-libgcc-file-name
    OUTPUT_VARIABLE VYRA_GCC_FOLDER OUTPUT_STRIP_TRAILING_WHITESPACE COMMAND_ERROR_IS_FATAL ANY)
cmake_path(GET VYRA_GCC_FOLDER PARENT_PATH VYRA_GCC_FOLDER)
set(CMAKE_CXX_FLAGS_INIT "-isystem ${VYRA_GCC_FOLDER}/include/c++ \
-isystem ${VYRA_GCC_FOLDER}/include/c++/x86_64-w64-mingw32 \
-isystem ${VYRA_GCC_FOLDER}/include/c++/backward")
include(${CMAKE_CURRENT_LIST_DIR}/windows.cmake)

# clang's linker; g++'s linker rejects clang's type information as conflicting.
foreach(kind EXE SHARED)
    string(APPEND CMAKE_${kind}_LINKER_FLAGS_INIT " -fuse-ld=lld -L${VYRA_GCC_FOLDER} -lwinpthread")
endforeach()
