// Part of TopenCLInfo: the directory of kernel sources, and reading them.
#include "host/Application.h"
#include "runtime/TopenCLInfo.h"

#include <cstdint>
#include <cstdio>
#include <cstring>
#include <limits>
#include <memory>

namespace {

struct FileCloser {
    void operator()(std::FILE* file) const { std::fclose(file); }
};
using File = std::unique_ptr<std::FILE, FileCloser>;

// Returns the size in bytes, or a negative number on failure. Sets the position to the start.
long fileSize(std::FILE* file)
{
    if (std::fseek(file, 0, SEEK_END) != 0)
        return -1;
    const long size = std::ftell(file);
    return std::fseek(file, 0, SEEK_SET) == 0 ? size : -1;
}

} // namespace

Tstring& TopenCLInfo::getAbsolutePathToResources()
{
    if (fResourcesPath.length() == 0)
        fResourcesPath = TappLocale::getResourcesLocation();
    return fResourcesPath;
}

bool TopenCLInfo::oclLoadProgSource(Tstring& source, const char* fileName, const char* preamble)
{
    source.setLength(0);
    // Binary, so that the OpenCL compiler receives line ends unchanged.
    const File file(std::fopen(fileName, "rb"));
    if (!file)
        return false;

    const std::size_t preambleLength = std::strlen(preamble);
    const long size = fileSize(file.get());
    // Also rejects directories, which open on some systems and report a huge size.
    if (size < 0 || size > std::numeric_limits<std::int32_t>::max())
        return false;
    const std::size_t textLength = preambleLength + static_cast<std::size_t>(size);
    if (textLength >= std::numeric_limits<std::uint32_t>::max())
        return false;

    source.setLength(static_cast<unsigned int>(textLength + 1));
    std::memcpy(source.data(), preamble, preambleLength);
    // Reads one element of the file's size, which fails for an empty file.
    if (std::fread(source.data() + preambleLength, static_cast<std::size_t>(size), 1, file.get()) !=
        1)
        return false;
    source.setLength(static_cast<unsigned int>(textLength));
    return true;
}
