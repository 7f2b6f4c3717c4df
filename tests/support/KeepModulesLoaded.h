// For tests that load drivers, so that the leak check stays on.
#pragma once

#include <cstddef>

#include <dlfcn.h>
#include <link.h>

// Keeps all loaded modules until the process ends: memory that static objects of a driver own is
// reported as leaked after the driver is unloaded.
inline void keepModulesLoaded()
{
    dl_iterate_phdr(
        [](dl_phdr_info* module, std::size_t, void*) {
            dlopen(module->dlpi_name, RTLD_NOLOAD | RTLD_NODELETE | RTLD_LAZY);
            return 0;
        },
        nullptr);
}
