#include "harness/Table.h"

#include <algorithm>
#include <utility>

namespace {

using Row = std::vector<std::string>;

void writeRow(std::ostream& output, const Row& row, const std::vector<std::size_t>& widths)
{
    for (std::size_t column = 0; column < row.size(); ++column) {
        const std::string padding(widths[column] - row[column].size(), ' ');
        output << "| " << (column == 0 ? row[column] + padding : padding + row[column]) << ' ';
    }
    output << "|\n";
}

} // namespace

Table::Table(std::vector<std::string> header) : fRows{std::move(header)} {}

void Table::add(std::vector<std::string> row)
{
    fRows.push_back(std::move(row));
}

void Table::write(std::ostream& output) const
{
    std::vector<std::size_t> widths(fRows.front().size(), 3); // the minimum in Markdown
    for (const Row& row : fRows) {
        for (std::size_t column = 0; column < row.size(); ++column)
            widths[column] = std::max(widths[column], row[column].size());
    }
    writeRow(output, fRows.front(), widths);
    for (std::size_t column = 0; column < widths.size(); ++column)
        output << "| " << std::string(widths[column] - (column == 0 ? 0 : 1), '-')
               << (column == 0 ? " " : ": ");
    output << "|\n";
    for (std::size_t index = 1; index < fRows.size(); ++index)
        writeRow(output, fRows[index], widths);
}
