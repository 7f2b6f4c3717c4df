#include "diagnostics/CLInternalWarning.h"

#include "diagnostics/CLWarningSink.h"

#include <atomic>
#include <cstdarg>
#include <cstdio>
#include <memory>
#include <new>

namespace {

void discardWarning(const char*) {}

constinit std::atomic<CLWarningSink> currentSink = discardWarning;

// The whole message, or null when it cannot be formatted or there is no memory for it.
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

void setCLWarningSink(CLWarningSink sink)
{
    currentSink = sink ? sink : discardWarning;
}

void CLInternalWarning(const char* format, ...)
{
    va_list arguments;
    va_start(arguments, format);
    const std::unique_ptr<char[]> text = formatMessage(format, arguments);
    va_end(arguments);
    const CLWarningSink sink = currentSink;
    sink(text ? text.get() : "");
}
