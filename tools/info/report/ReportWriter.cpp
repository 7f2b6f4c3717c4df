#include "tools/info/report/ReportWriter.h"

#include <cstddef>
#include <sstream>

namespace info {
namespace {

constexpr std::size_t kIndent = 2;
constexpr std::size_t kLabelWidth = 36; // the longest label and a gap
constexpr std::size_t kPageWidth = 110; // columns

} // namespace

void ReportWriter::section(const std::string& title)
{
    fText += (fText.empty() ? "" : "\n") + title + "\n";
}

void ReportWriter::row(const std::string& label, const std::string& value)
{
    std::string head(kIndent, ' ');
    head += label;
    const std::size_t column = kIndent + kLabelWidth;
    head.resize(head.size() < column ? column : head.size() + 1, ' ');
    fText += head;
    wrap(value, column);
}

void ReportWriter::paragraph(const std::string& text)
{
    fText.append(kIndent, ' ');
    wrap(text, kIndent);
}

void ReportWriter::quote(const std::string& text)
{
    std::istringstream lines(text);
    for (std::string line; std::getline(lines, line);)
        fText += "  | " + line + "\n";
}

// Appends to the current line, and ends it.
void ReportWriter::wrap(const std::string& text, std::size_t indent)
{
    std::size_t width = indent;
    std::istringstream words(text);
    bool first = true;
    for (std::string word; words >> word; first = false) {
        if (!first && width + 1 + word.size() > kPageWidth) {
            fText += "\n" + std::string(indent, ' ');
            width = indent;
        } else if (!first) {
            fText += ' ';
            ++width;
        }
        fText += word;
        width += word.size();
    }
    while (fText.ends_with(' '))
        fText.pop_back();
    fText += '\n';
}

} // namespace info
