// The entry function of the Windows library.
#if defined(_WIN32)

#include <windows.h>

BOOL WINAPI DllMain(HINSTANCE module, DWORD reason, LPVOID /*reserved*/)
{
    // The library's thread-local data needs no constructor, so it needs no notification of threads.
    // The call fails, without harm, if the compiler uses static thread-local storage.
    if (reason == DLL_PROCESS_ATTACH)
        DisableThreadLibraryCalls(module);
    return TRUE;
}

#endif
