// Tables in Markdown.
#pragma once

#include <ostream>
#include <string>
#include <vector>

// A Markdown table with aligned columns.
class Table {
public:
    explicit Table(std::vector<std::string> header);

    // Adds a row with as many cells as the header.
    void add(std::vector<std::string> row);

    // Writes the table. The first column is aligned left, the others right.
    void write(std::ostream& output) const;

private:
    std::vector<std::vector<std::string>> fRows; // the header is the first
};
