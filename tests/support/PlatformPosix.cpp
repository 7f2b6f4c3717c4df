#include "Platform.h"

#include <cstdio>
#include <cstdlib>

#include <dlfcn.h>

void setEnvironment(const char* name, const char* value)
{
    setenv(name, value, 1);
}

void removeEnvironment(const char* name)
{
    unsetenv(name);
}

void* loadLibrary(const char* path)
{
    return dlopen(path, RTLD_NOW | RTLD_LOCAL);
}

void* symbolOf(void* library, const char* name)
{
    return dlsym(library, name);
}

void unloadLibrary(void* library)
{
    dlclose(library);
}

std::string outputOf(const std::string& program)
{
    std::string output;
    if (FILE* pipe = popen(program.c_str(), "r")) {
        for (int character = std::fgetc(pipe); character != EOF; character = std::fgetc(pipe))
            output += static_cast<char>(character);
        pclose(pipe);
    }
    return output.substr(0, output.find_last_not_of('\n') + 1);
}
