#include "Platform.h"

#include <cstdio>
#include <cstdlib>

#include <windows.h>

void setEnvironment(const char* name, const char* value)
{
    _putenv_s(name, value);
}

void removeEnvironment(const char* name)
{
    _putenv_s(name, "");
}

void* loadLibrary(const char* path)
{
    return LoadLibraryA(path);
}

void* symbolOf(void* library, const char* name)
{
    return reinterpret_cast<void*>(GetProcAddress(static_cast<HMODULE>(library), name));
}

void unloadLibrary(void* library)
{
    FreeLibrary(static_cast<HMODULE>(library));
}

std::string outputOf(const std::string& program)
{
    std::string output;
    if (FILE* pipe = _popen(program.c_str(), "r")) {
        for (int character = std::fgetc(pipe); character != EOF; character = std::fgetc(pipe))
            output += static_cast<char>(character);
        _pclose(pipe);
    }
    return output.substr(0, output.find_last_not_of('\n') + 1);
}
