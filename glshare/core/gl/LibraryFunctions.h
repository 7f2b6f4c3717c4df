// The exported functions of a shared library that is opened at run time.
#pragma once

namespace glshare {

class LibraryFunctions {
public:
    // Opens the library, and never closes it. If it cannot be opened, find() returns false.
    explicit LibraryFunctions(const char* fileName) noexcept;

    // Stores the address of a function, null if the library lacks it. Returns whether it was found.
    template <typename Function>
    [[nodiscard]] bool find(Function& function, const char* name) const noexcept
    {
        function = reinterpret_cast<Function>(address(name));
        return function != nullptr;
    }

private:
    [[nodiscard]] void* address(const char* name) const noexcept;

    void* fLibrary;
};

} // namespace glshare
