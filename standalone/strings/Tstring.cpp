#include "host/Tstring.h"

#include "standalone/strings/Fnv1a.h"

#include <string_view>

namespace {

int findFrom(const std::string& text, std::string_view wanted, int from)
{
    const std::size_t start = from > 0 ? static_cast<std::size_t>(from) : 0;
    const std::size_t found = text.find(wanted, start);
    return found == std::string::npos ? -1 : static_cast<int>(found);
}

// Returns the UTF-8 sequence of a code point.
std::string utf8(char32_t code)
{
    const auto lead = [code](char32_t mark, unsigned shift) {
        return static_cast<char>(mark | code >> shift);
    };
    const auto next = [code](unsigned shift) {
        return static_cast<char>(0x80 | (code >> shift & 0x3F));
    };
    if (code < 0x80)
        return {static_cast<char>(code)};
    if (code < 0x800)
        return {lead(0xC0, 6), next(0)};
    if (code < 0x10000)
        return {lead(0xE0, 12), next(6), next(0)};
    return {lead(0xF0, 18), next(12), next(6), next(0)};
}

} // namespace

Tstring::Tstring(const char* text) : fText(text != nullptr ? text : "") {}

unsigned int Tstring::length() const
{
    return static_cast<unsigned int>(fText.size());
}

void Tstring::setLength(unsigned int length)
{
    fText.resize(length);
}

const char* Tstring::asChar() const
{
    return fText.c_str();
}

char* Tstring::data()
{
    return fText.data();
}

unsigned int Tstring::hash() const
{
    return vyra::host::fnv1a<std::uint32_t>(fText);
}

int Tstring::findMB(const char* text, int from) const
{
    return text != nullptr ? findFrom(fText, text, from) : -1;
}

int Tstring::findMB(wchar_t character, int from) const
{
    const auto code = static_cast<char32_t>(character);
    // Half of a surrogate pair is not a character: it has no bytes.
    const bool isSurrogate = code >= 0xD800 && code < 0xE000;
    return isSurrogate ? -1 : findFrom(fText, utf8(code), from);
}

void Tstring::removeInitialAndFinalSpaces()
{
    const std::size_t last = fText.find_last_not_of(' ');
    fText.erase(last == std::string::npos ? 0 : last + 1);
    fText.erase(0, fText.find_first_not_of(' '));
}

Tstring& Tstring::operator+=(const Tstring& other)
{
    fText += other.fText;
    return *this;
}

Tstring& Tstring::operator+=(const char* text)
{
    if (text != nullptr) {
        fText += text;
    }
    return *this;
}
