// Preloaded into Wine: keeps the first handler of SIGQUIT.
//
// Wine ends the threads of an exiting program with that signal. LLVM, inside PoCL, replaces Wine's handler
// by its own, and the signal then kills the program instead of letting it exit.
#define _GNU_SOURCE
#include <dlfcn.h>
#include <signal.h>
#include <stddef.h>
#include <string.h>

int sigaction(int number, const struct sigaction* action, struct sigaction* previous)
{
    static int isSet = 0;
    int (*real)(int, const struct sigaction*, struct sigaction*) = NULL;
    void* const symbol = dlsym(RTLD_NEXT, "sigaction");
    memcpy(&real, &symbol, sizeof real);
    if (number != SIGQUIT || action == NULL)
        return real(number, action, previous);
    if (isSet)
        return real(number, NULL, previous);
    isSet = 1;
    return real(number, action, previous);
}
