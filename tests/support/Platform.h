// What tests ask of the operating system.
#pragma once

#include <string>

// Windows removes a variable that is set to the empty text.
void setEnvironment(const char* name, const char* value);
void removeEnvironment(const char* name);

// A shared library of that path, or null; the address of its symbol. Unloading ends with the last.
void* loadLibrary(const char* path);
void* symbolOf(void* library, const char* name);
void unloadLibrary(void* library);

// What `program`, run without arguments, writes to standard output, without the end of the line.
std::string outputOf(const std::string& program);
