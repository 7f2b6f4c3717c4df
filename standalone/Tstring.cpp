#include "host/Tstring.h"

#include "standalone/FowlerNollVo.h"

#include <QChar>
#include <QString>

#include <string_view>

namespace {

int findFrom(const std::string& text, std::string_view wanted, int from)
{
    const std::size_t start = from > 0 ? static_cast<std::size_t>(from) : 0;
    const std::size_t found = text.find(wanted, start);
    return found == std::string::npos ? -1 : static_cast<int>(found);
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
    return vyra::host::fowlerNollVo<std::uint32_t>(fText);
}

int Tstring::findMB(const char* text, int from) const
{
    return text != nullptr ? findFrom(fText, text, from) : -1;
}

int Tstring::findMB(wchar_t character, int from) const
{
    const auto code = static_cast<char32_t>(character);
    if (code < 0x80) {
        const char byte = static_cast<char>(code);
        return findFrom(fText, std::string_view(&byte, 1), from);
    }
    // Half of a surrogate pair is no character and has no bytes.
    if (QChar::isSurrogate(code)) {
        return -1;
    }
    const std::string utf8 = QString::fromUcs4(&code, 1).toStdString();
    return findFrom(fText, utf8, from);
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
