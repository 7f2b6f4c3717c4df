// Operating-system functions for tests.
#pragma once

// Sets a variable; removes it for null, and on Windows also for the empty text.
void setEnvironment(const char* name, const char* value);

// Loads a shared library, null on failure; returns the address of a symbol; unloads the library.
void* loadLibrary(const char* path);
void* symbolOf(void* library, const char* name);
void unloadLibrary(void* library);
