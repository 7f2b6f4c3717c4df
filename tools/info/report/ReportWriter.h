// Layout of the text report.
#pragma once

#include <string>

namespace info {

// Formats plain text in sections of aligned rows. Long values are wrapped between words and
// continue below their first line.
class ReportWriter {
public:
    void section(const std::string& title);
    // Adds a label with its value.
    void row(const std::string& label, const std::string& value);
    // Adds wrapped text.
    void paragraph(const std::string& text);
    // Adds lines unchanged, marked as quoted.
    void quote(const std::string& text);

    const std::string& text() const noexcept { return fText; }

private:
    void wrap(const std::string& text, std::size_t indent);

    std::string fText;
};

} // namespace info
