// A shared library of the system, opened at run time. Internal.
#pragma once

// Both texts are NUL-terminated; null is returned if there is no such library or symbol. An opened
// library stays open until the process ends, as do the handles that its functions return.
[[nodiscard]] void* openSharedLibrary(const char* name);
[[nodiscard]] void* findSymbol(void* library, const char* name);
