// The entry function of the Windows library.
#if defined(_WIN32)

#include <windows.h>

BOOL WINAPI DllMain(HINSTANCE module, DWORD reason, LPVOID /*reserved*/)
{
    // What the library keeps per thread is a plain buffer, so it need not hear of threads. A
    // compiler may give the library thread-local storage of a kind for which Windows refuses the
    // call; no matter.
    if (reason == DLL_PROCESS_ATTACH)
        DisableThreadLibraryCalls(module);
    return TRUE;
}

#endif
