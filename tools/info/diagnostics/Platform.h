// The operating system's part of the diagnostics.
#pragma once

#include <cstdio>
#include <string>
#include <vector>

namespace info {

// Returns the environment variables of this process as NAME=VALUE.
std::vector<std::string> environmentEntries();

// Sets an environment variable, also for the libraries of this process.
void setEnvironmentVariable(const char* name, const std::string& value);

// Returns the window systems that Qt tries if the user has named none, separated by semicolons.
const char* defaultWindowSystems();

// Discards the system's record of earlier failures to open a library.
void clearLibraryError();

// Returns why the last library could not be opened.
std::string libraryError();

// Returns the file that a function was loaded from; empty for null and if it is unknown.
std::string fileOfFunction(void* function);

// Returns a nameless temporary file for reading and writing; null on failure.
std::FILE* openTemporaryFile();

// Descriptors of the standard streams while these write elsewhere; -1 while they do not.
struct StandardStreams {
    int output = -1;
    int error = -1;
};

// Makes standard output and standard error write to `file`. Returns what restores them.
StandardStreams redirectStandardStreams(std::FILE* file);

// Undoes redirectStandardStreams and resets `streams`.
void restoreStandardStreams(StandardStreams& streams);

} // namespace info
