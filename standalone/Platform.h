// What the operating system's loader knows.
#pragma once

#include <filesystem>

namespace vyra::host {

// The address of `symbol` in the library `name`, or null when the process has not loaded that
// library or it has no such symbol. Loads nothing.
void* symbolOfLoadedLibrary(const char* name, const char* symbol);

// The file that this library was loaded from, links resolved; empty when the loader can't tell.
std::filesystem::path fileOfThisLibrary();

} // namespace vyra::host
