#include "diagnostics/CLInternalWarning.h"

#include "diagnostics/CLWarningSink.h"

#include <atomic>
#include <cstdarg>
#include <cstdio>
#include <memory>
#include <new>

namespace {

// Null stands for the built-in sink, which writes nothing.
constinit std::atomic<CLWarningSink> currentSink = nullptr;

// Returns the whole message, or null if it cannot be formatted or memory runs out.
std::unique_ptr<char[]> formatMessage(const char* format, va_list arguments)
{
    va_list argumentsAgain;
    va_copy(argumentsAgain, arguments);
    std::unique_ptr<char[]> text;
    const int length = std::vsnprintf(nullptr, 0, format, arguments);
    if (length >= 0) {
        const std::size_t size = static_cast<std::size_t>(length) + 1;
        text.reset(new (std::nothrow) char[size]);
        if (text)
            std::vsnprintf(text.get(), size, format, argumentsAgain);
    }
    va_end(argumentsAgain);
    return text;
}

} // namespace

CLWarningSink setCLWarningSink(CLWarningSink sink)
{
    return currentSink.exchange(sink);
}

void CLInternalWarning(const char* format, ...)
{
    va_list arguments;
    va_start(arguments, format);
    const std::unique_ptr<char[]> text = formatMessage(format, arguments);
    va_end(arguments);
    if (const CLWarningSink sink = currentSink)
        sink(text ? text.get() : "");
}
