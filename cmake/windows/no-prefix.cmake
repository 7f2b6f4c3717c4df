# Programs look for DLLs without the prefix "lib".
set(CMAKE_SHARED_LIBRARY_PREFIX "")
