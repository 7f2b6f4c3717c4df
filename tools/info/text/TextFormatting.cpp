#include "tools/info/text/TextFormatting.h"

#include <array>
#include <cstdio>

namespace info {
namespace {

std::string joined(const std::vector<std::string>& texts, const char* separator, const char* quote)
{
    std::string list;
    for (const std::string& text : texts)
        list += (list.empty() ? "" : separator) + (quote + text + quote);
    return list;
}

struct TypeName {
    cl_device_type bit;
    const char* name;
};

constexpr TypeName kTypeNames[] = {
    {CL_DEVICE_TYPE_GPU, "GPU"},
    {CL_DEVICE_TYPE_CPU, "CPU"},
    {CL_DEVICE_TYPE_ACCELERATOR, "accelerator"},
    {CL_DEVICE_TYPE_CUSTOM, "custom device"},
    {CL_DEVICE_TYPE_DEFAULT, "default device"},
};

} // namespace

std::string yesOrNo(bool value)
{
    return value ? "yes" : "no";
}

std::string hex(unsigned number)
{
    std::array<char, 16> text{};
    std::snprintf(text.data(), text.size(), "0x%x", number);
    return text.data();
}

std::string quoted(const std::string& text)
{
    return "'" + text + "'";
}

std::string quotedList(const std::vector<std::string>& texts)
{
    return joined(texts, ", ", "'");
}

std::string commaList(const std::vector<std::string>& texts)
{
    return joined(texts, ", ", "");
}

std::string deviceTypeName(cl_device_type type)
{
    std::vector<std::string> names;
    for (const TypeName& known : kTypeNames) {
        if (type & known.bit)
            names.emplace_back(known.name);
    }
    return names.empty() ? "unknown type" : joined(names, " and ", "");
}

} // namespace info
