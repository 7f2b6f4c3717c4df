// The exported functions of a shared library that is opened at run time.
#pragma once

namespace glshare {

class LibraryFunctions {
public:
    // Opens the library, and never closes it. If there is none of that name, nothing is found.
    explicit LibraryFunctions(const char* fileName);

    // Fills in a function pointer; false if the library has no such function.
    template <typename Function>
    [[nodiscard]] bool find(Function& function, const char* name) const
    {
        function = reinterpret_cast<Function>(address(name));
        return function != nullptr;
    }

private:
    [[nodiscard]] void* address(const char* name) const;

    void* fLibrary;
};

// Has `call` called when the process exits, while threads that use the libraries still run; never
// where the system ends all threads first.
void callAtExit(void (*call)());

// Has `call` called in each child that this process forks, before anything else runs there; never
// where processes are not forked. False if the system has no memory for it.
[[nodiscard]] bool callInForkedChild(void (*call)());

} // namespace glshare
