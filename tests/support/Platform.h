// Operating-system functions for tests.
#pragma once

// Windows removes a variable that is set to the empty text.
void setEnvironment(const char* name, const char* value);
void removeEnvironment(const char* name);

// Loads a shared library, null on failure; returns the address of a symbol; unloads the library.
void* loadLibrary(const char* path);
void* symbolOf(void* library, const char* name);
void unloadLibrary(void* library);
