// Part of TopenCLInfo: where kernel sources lie, and how they are read.
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

// The size in bytes, or a negative number when it cannot be told. Leaves the position at the start.
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
    // Binary, so that line ends reach the OpenCL compiler unchanged.
    const File file(std::fopen(fileName, "rb"));
    if (!file)
        return false;

    const std::size_t preambleLength = std::strlen(preamble);
    const long size = fileSize(file.get());
    // Also refuses what is no file: a directory opens here and tells an absurd size.
    if (size < 0 || size > std::numeric_limits<std::int32_t>::max())
        return false;
    const std::size_t textLength = preambleLength + static_cast<std::size_t>(size);
    if (textLength >= std::numeric_limits<std::uint32_t>::max())
        return false;

    source.setLength(static_cast<unsigned int>(textLength + 1));
    std::memcpy(source.data(), preamble, preambleLength);
    // One element of the file's size: an empty file counts as unreadable.
    if (std::fread(source.data() + preambleLength, static_cast<std::size_t>(size), 1, file.get()) !=
        1)
        return false;
    source.setLength(static_cast<unsigned int>(textLength));
    return true;
}
