// Preloaded into Wine: the first handler of SIGQUIT stays.
//
// Wine ends the threads of an exiting program by that signal. LLVM, inside PoCL, puts a handler of its own
// in the place of Wine's, and the program then dies by the signal instead of exiting.
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
