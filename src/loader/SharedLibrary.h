// A shared library of the system, opened at run time. Internal.
#pragma once

// Both texts are NUL-terminated; null stands for "not there". An opened library stays open until
// the process ends, since the handles that its functions return do.
void* openSharedLibrary(const char* name);
void* findSymbol(void* library, const char* name);
