// Plain text in sections of aligned rows.
#pragma once

#include <string>

namespace info {

// Long values are broken between words and continue below their beginning.
class Sheet {
public:
    void section(const std::string& title);
    // A label with its value.
    void row(const std::string& label, const std::string& value);
    // A sentence, or several.
    void paragraph(const std::string& text);
    // Lines as they are, marked as quoted.
    void quote(const std::string& text);

    const std::string& text() const { return fText; }

private:
    void wrap(const std::string& text, std::size_t indent);

    std::string fText;
};

} // namespace info
