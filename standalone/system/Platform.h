// Queries of the operating system's loader.
#pragma once

#include <filesystem>

namespace vyra::host {

// Returns the address of `symbol` in the library `name`, or null if the process has not loaded that
// library or it has no such symbol. Loads nothing.
[[nodiscard]] void* symbolOfLoadedLibrary(const char* name, const char* symbol);

// Returns the file that this library was loaded from, with symbolic links resolved; empty on
// failure.
[[nodiscard]] std::filesystem::path fileOfThisLibrary();

} // namespace vyra::host
