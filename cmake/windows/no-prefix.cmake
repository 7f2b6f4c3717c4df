# DLLs are named as their programs look for them: without "lib".
set(CMAKE_SHARED_LIBRARY_PREFIX "")
